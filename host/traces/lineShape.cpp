#include "traces/lineShape.h"

#include "text/words.h"
#include "traces/moments.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

constexpr const char* kDigits = "0123456789";
constexpr const char* kHexDigits = "0123456789abcdefABCDEF";

bool consistsOf(std::string_view word, const char* characters, size_t least, size_t most)
{
    return word.size() >= least && word.size() <= most &&
           word.find_first_not_of(characters) == std::string_view::npos;
}

// "-1.303e-04": an exponent has two digits at least, so one that was cut short is none.
bool isScientific(std::string_view word)
{
    const size_t e = word.find_first_of("eE");
    return e != std::string_view::npos && word.size() - e >= 4 && finiteIn(word);
}

bool isDecimal(std::string_view word)
{
    return word.find_first_of("eE") == std::string_view::npos && finiteIn(word);
}

bool isShort(std::string_view word)
{
    return word.size() <= 4 && std::all_of(word.begin(), word.end(), [](unsigned char character) {
               return std::isalnum(character) != 0;
           });
}

bool fits(std::string_view word, char letter)
{
    const auto isWhole = [&] { return numberIn<int64_t>(word).has_value(); };
    switch (letter) {
    case 'D':
        return tMoments().ofDate(word, "00:00:00").has_value();
    case 'T':
        return tMoments().ofDate("2000-12-31", word).has_value();
    case 'm':
        return tMoments().ofJulian(word, "0").has_value();
    case 's':
        return tMoments().ofJulian("50000", word).has_value();
    case 'e':
        return isScientific(word);
    case 'E':
        return word == "-" || isScientific(word);
    case 'f':
        return isDecimal(word);
    case 'x':
        return isScientific(word) || (isDecimal(word) && word.find('.') != std::string_view::npos);
    case 'i':
        return isWhole();
    case 'I':
        return word == "-" || isWhole();
    case 'b':
        return consistsOf(word, "01", 3, 4);
    case 'h':
        return consistsOf(word, kHexDigits, 8, 8);
    case 'H':
        return consistsOf(word, kHexDigits, 1, 8);
    case 'l':
        return consistsOf(word, "N+-?", 1, 1);
    case 'u':
        return isShort(word);
    case 'o':
        return word.size() == 5 && word.find_first_of(kDigits) == std::string_view::npos;
    default:
        return true;
    }
}

} // namespace

tWords wordsOf(std::string_view line)
{
    tWords words;
    for (std::string_view word = takeWord(line); !word.empty(); word = takeWord(line))
        words.push_back(word);
    return words;
}

std::string printable(std::string_view text, size_t most)
{
    std::string shown(text.substr(0, most));
    for (char& character : shown)
        if (character < ' ' || character > '~') character = character == '\t' ? ' ' : '?';
    return text.size() > most ? shown + "..." : shown;
}

std::optional<double> finiteIn(std::string_view text)
{
    const auto number = numberIn<double>(text);
    return number && std::isfinite(*number) ? number : std::nullopt;
}

size_t fittingWords(const tWords& words, std::string_view shape)
{
    size_t count = 0;
    for (const char letter : shape) {
        if (letter == '|') continue;
        if (count == words.size() || !fits(words[count], letter)) break;
        ++count;
    }
    return count;
}

std::string misfit(const tWords& words, std::string_view shape)
{
    const size_t count = fittingWords(words, shape);
    size_t letters = 0;
    char expected = '\0'; // of the first word that does not fit
    bool mayEnd = false;
    for (const char letter : shape) {
        mayEnd = mayEnd || (letter == '|' && letters == count);
        if (letter == '|') continue;
        if (letters++ == count) expected = letter;
    }
    if (count == words.size()) return count == letters || mayEnd ? "" : "cut short";
    if (count == letters) return "more fields than there should be";
    const bool number = std::string_view("efxiEI").find(expected) != std::string_view::npos;
    return fmt::format("field {}, '{}', is {}", count + 1, printable(words[count], 30),
                       number ? "not a number as it should be" : "not what it should be");
}

} // namespace dravikHost
