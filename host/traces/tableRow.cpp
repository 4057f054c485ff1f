#include "traces/tableRow.h"

#include "text/words.h"
#include "traces/lineShape.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <iterator>

namespace dravikHost {

namespace {

std::string_view trimmed(std::string_view text)
{
    const auto isBlank = [](char character) { return character == ' ' || character == '\t'; };
    while (!text.empty() && isBlank(text.front()))
        text.remove_prefix(1);
    while (!text.empty() && isBlank(text.back()))
        text.remove_suffix(1);
    return text;
}

std::string unquoted(std::string_view field)
{
    field = trimmed(field);
    for (const char quote : {'"', '\''}) {
        if (field.size() >= 2 && field.front() == quote && field.back() == quote)
            field = trimmed(field.substr(1, field.size() - 2));
    }
    return std::string(field);
}

// Outside of quotes; the line's size if it does not stand there.
size_t findSeparator(std::string_view line, char separator)
{
    bool quoted = false;
    for (size_t i = 0; i < line.size(); ++i) {
        if (line[i] == '"') quoted = !quoted;
        if (line[i] == separator && !quoted) return i;
    }
    return line.size();
}

std::string lowerCase(std::string_view text)
{
    std::string lower(text);
    std::transform(lower.begin(), lower.end(), lower.begin(), [](unsigned char character) {
        return static_cast<char>(std::tolower(character));
    });
    return lower;
}

// With a point for a comma that does not separate. "1,234" between commas may be a thousand.
std::string withPoint(const std::string& field, char separator)
{
    std::string text = field;
    const size_t comma = text.find(',');
    if (comma == std::string::npos || text.find('.') != std::string::npos) return text;
    const bool thousands = separator == ',' && text.size() - comma == 4;
    if (!thousands) text[comma] = '.';
    return text;
}

} // namespace

char separatorOf(std::string_view line)
{
    line = trimmed(line);
    for (const char separator : {';', '\t'})
        if (findSeparator(line, separator) < line.size()) return separator;
    const size_t comma = findSeparator(line, ',');
    if (comma == line.size()) return kBlanks;
    // "0,125 13,223" has decimal commas, "0.125, 13.223" and "0 ,5" have none.
    const size_t blank = line.find(' ');
    const bool decimal = blank != std::string_view::npos && comma < blank &&
                         line[comma + 1] != ' ' &&
                         std::isdigit(static_cast<unsigned char>(line[blank - 1])) != 0 &&
                         line.find(',', blank) != std::string_view::npos;
    return decimal ? kBlanks : ',';
}

std::vector<std::string> fieldsOf(std::string_view line, char separator)
{
    std::vector<std::string> fields;
    if (separator == kBlanks) {
        for (const std::string_view word : wordsOf(line))
            fields.push_back(unquoted(word));
        return fields;
    }
    for (bool more = true; more;) {
        const size_t end = findSeparator(line, separator);
        fields.push_back(unquoted(line.substr(0, end)));
        more = end < line.size();
        line.remove_prefix(std::min(end + 1, line.size()));
    }
    return fields;
}

std::optional<double> numberOf(const std::string& field, char separator)
{
    return finiteIn(withPoint(field, separator));
}

std::optional<tExactNs> exactNsOf(const std::string& field, char separator, int64_t unitNs)
{
    const std::string text = withPoint(field, separator);
    const auto number = finiteIn(text);
    if (!number) return std::nullopt;
    const size_t point = text.find('.');
    const auto perUnit = static_cast<double>(unitNs);
    constexpr double kMost = 1.8446744e19; // below 2^64
    if (!(std::fabs(*number) * perUnit < kMost)) return std::nullopt;
    const std::string whole = text.substr(0, point);
    const auto above = numberIn<uint64_t>(whole);
    const auto below = numberIn<int64_t>(whole);
    const bool exponent = text.find_first_of("eE") != std::string::npos;
    if (exponent || (!above && !below)) {
        const double ns = *number * perUnit;
        if (std::fabs(ns) > 9e18) return std::nullopt;
        const double floor = std::floor(ns);
        return tExactNs{static_cast<uint64_t>(static_cast<int64_t>(floor)), ns - floor};
    }
    const auto fraction = point == std::string::npos ? 0.0 : finiteIn("0" + text.substr(point));
    if (!fraction) return std::nullopt;
    const double partNs = (text[0] == '-' ? -*fraction : *fraction) * perUnit;
    const double floor = std::floor(partNs);
    const uint64_t wholeNs =
        (above ? *above : static_cast<uint64_t>(*below)) * static_cast<uint64_t>(unitNs);
    return tExactNs{wholeNs + static_cast<uint64_t>(static_cast<int64_t>(floor)), partNs - floor};
}

tTitle titleOf(const std::string& field)
{
    std::string text = lowerCase(unquoted(field));
    tTitle title;
    const size_t open = text.find_first_of("([");
    if (open != std::string::npos) {
        const size_t close = text.find_first_of(")]", open);
        title.unit = trimmed(text.substr(open + 1, close - open - 1));
        text = trimmed(std::string_view(text).substr(0, open));
    }
    const size_t cut = text.find_last_of("_ /");
    if (open == std::string::npos && cut != std::string::npos && unitNsOf(text.substr(cut + 1))) {
        title.unit = text.substr(cut + 1);
        text = trimmed(std::string_view(text).substr(0, cut));
    }
    std::replace(text.begin(), text.end(), ' ', '_');
    title.name = text;
    return title;
}

std::vector<std::string> titlesOf(std::string_view line, char separator)
{
    line = trimmed(line);
    while (!line.empty() && (line.front() == '#' || line.front() == '%'))
        line = trimmed(line.substr(1));
    if (separator != kBlanks || line.find_first_of("([") == std::string_view::npos)
        return fieldsOf(line, separator);
    std::vector<std::string> titles;
    while (!line.empty()) {
        const size_t end = std::min(line.find_first_of(")]"), line.size() - 1);
        titles.push_back(unquoted(line.substr(0, end + 1)));
        line = trimmed(line.substr(end + 1));
    }
    return titles;
}

std::optional<double> unitNsOf(const std::string& unit)
{
    struct tUnitName {
        std::string_view name;
        double ns;
    };
    constexpr tUnitName kUnits[] = {
        {"s", 1e9},         {"sec", 1e9},          {"secs", 1e9},
        {"second", 1e9},    {"seconds", 1e9},      {"ms", 1e6},
        {"msec", 1e6},      {"milliseconds", 1e6}, {"us", 1e3},
        {"usec", 1e3},      {"microseconds", 1e3}, {"\xc2\xb5s", 1e3},
        {"\xce\xbcs", 1e3}, {"\xb5s", 1e3},        {"ns", 1},
        {"nsec", 1},        {"nanoseconds", 1},    {"ps", 1e-3},
        {"psec", 1e-3},     {"picoseconds", 1e-3}, {"min", 60e9},
        {"h", 3600e9},      {"d", 86400e9},        {"day", 86400e9},
        {"days", 86400e9},
    };
    const std::string lower = lowerCase(unit);
    const auto* const found =
        std::find_if(std::begin(kUnits), std::end(kUnits),
                     [&](const tUnitName& known) { return known.name == lower; });
    return found == std::end(kUnits) ? std::nullopt : std::optional(found->ns);
}

} // namespace dravikHost
