#include "text/words.h"

#include "text/quantity.h"

#include <algorithm>
#include <cctype>
#include <numeric>

namespace dravikHost {

namespace {

// Letters to insert, leave out or replace to make one word of the other.
size_t distance(std::string_view one, std::string_view other)
{
    std::vector<size_t> row(other.size() + 1);
    std::iota(row.begin(), row.end(), size_t{0});
    for (size_t i = 0; i < one.size(); ++i) {
        size_t diagonal = row[0];
        row[0] = i + 1;
        for (size_t j = 0; j < other.size(); ++j) {
            const bool same = std::tolower(one[i]) == std::tolower(other[j]);
            const size_t replaced = diagonal + (same ? 0 : 1);
            diagonal = row[j + 1];
            row[j + 1] = std::min({replaced, row[j] + 1, row[j + 1] + 1});
        }
    }
    return row.back();
}

} // namespace

std::string_view takeLine(std::string_view& text)
{
    const size_t end = std::min(text.find('\n'), text.size());
    std::string_view line = text.substr(0, end);
    text.remove_prefix(std::min(end + 1, text.size()));
    if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
    return line;
}

std::string_view takeWord(std::string_view& text)
{
    text.remove_prefix(std::min(text.find_first_not_of(" \t"), text.size()));
    const std::string_view word = text.substr(0, text.find_first_of(" \t"));
    text.remove_prefix(word.size());
    return word;
}

std::string_view takeField(std::string_view& text)
{
    const std::string_view field = text.substr(0, text.find(','));
    text.remove_prefix(std::min(field.size() + 1, text.size()));
    return field;
}

std::optional<int64_t> secondsIn(std::string_view text)
{
    constexpr uint32_t kMostSeconds = 2'000'000'000;
    const size_t point = text.find('.');
    const auto whole = numberIn<uint32_t>(text.substr(0, point));
    if (!whole || *whole > kMostSeconds) return std::nullopt;
    int64_t ns = *whole * kSecondNs;
    if (point == std::string_view::npos) return ns;
    const std::string_view digits = text.substr(point + 1);
    const auto fraction = numberIn<uint32_t>(digits);
    if (!fraction || digits.size() > 9) return std::nullopt;
    int64_t fractionNs = *fraction;
    for (size_t i = digits.size(); i < 9; ++i)
        fractionNs *= 10;
    return ns + fractionNs;
}

std::string didYouMean(std::string_view word, const std::vector<std::string>& words)
{
    constexpr size_t kLettersPerSlip = 3;
    const auto nearest = std::min_element(words.begin(), words.end(),
                                          [word](const std::string& one, const std::string& other) {
                                              return distance(word, one) < distance(word, other);
                                          });
    if (nearest == words.end() || distance(word, *nearest) > nearest->size() / kLettersPerSlip)
        return "";
    return "; did you mean " + *nearest + "?";
}

} // namespace dravikHost
