#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace dravikHost {

// Rows of tables as people and spreadsheets write them.
constexpr char kBlanks = ' '; // as a separator: any number of blanks and tabs

// The separator that a line shows: a semicolon, a tab, a comma, else blanks.
char separatorOf(std::string_view line);

// The fields without the blanks and the quotes around them.
std::vector<std::string> fieldsOf(std::string_view line, char separator);

// A finite number; with a decimal comma where the comma does not separate.
std::optional<double> numberOf(const std::string& field, char separator);

// A number of units, each of so many ns, whose whole part is kept to the last digit.
struct tExactNs {
    uint64_t whole; // modulo 2^64
    double fraction;
};
std::optional<tExactNs> exactNsOf(const std::string& field, char separator, int64_t unitNs);

// "TIE (ns)", "tie[ns]", "tie_ns", "TIE/ns" or "tie ns", in lower case.
struct tTitle {
    std::string name; // words with "_" between them
    std::string unit; // "": none
};
tTitle titleOf(const std::string& field);

// The titles of a header; blanks separate at the end of a unit where there are units in brackets.
std::vector<std::string> titlesOf(std::string_view line, char separator);

// How many ns a unit of time is; nothing if it is none.
std::optional<double> unitNsOf(const std::string& unit);

} // namespace dravikHost
