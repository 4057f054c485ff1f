#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace dravikHost {

using tWords = std::vector<std::string_view>;

// The words between blanks.
tWords wordsOf(std::string_view line);

// For people: its beginning, without what would do something to their terminal.
std::string printable(std::string_view text, size_t most = 60);

// A number that is one: neither infinite nor NaN.
std::optional<double> finiteIn(std::string_view text);

// What the words of a line look like, a letter for each; behind each "|" the rest may be missing,
// as older versions of a program did not print it.
//
//     D T  date, time of day          e    number with an exponent
//     m    modified Julian date       f    number without one
//     s    seconds of a day           x    number with an exponent or decimal point
//     n    any word                   i    whole number
//     b    zeros and ones             E I  as e and i, or "-"
//     h H  8 and 1 to 8 hex digits
//     l    leap status                u    letters and digits, at most 4
//     o    five characters of options
//
// Returns why the words do not fit, "" if they do.
std::string misfit(const tWords& words, std::string_view shape);

// How many of them fit before the first that does not.
size_t fittingWords(const tWords& words, std::string_view shape);

} // namespace dravikHost
