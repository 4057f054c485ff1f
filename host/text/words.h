#pragma once

#include <charconv>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace dravikHost {

// Pieces of a line.

// Splits a line off, without its end.
std::string_view takeLine(std::string_view& text);

// Splits the next word off the text; "" at its end.
std::string_view takeWord(std::string_view& text);

// Splits a field off, up to the next comma.
std::string_view takeField(std::string_view& text);

// The whole text as a number, a leading + included.
template <typename Number> std::optional<Number> numberIn(std::string_view text)
{
    if (text.size() > 1 && text[0] == '+' && text[1] != '-') text.remove_prefix(1);
    Number number{};
    const auto result = std::from_chars(text.data(), text.data() + text.size(), number);
    if (result.ec != std::errc() || result.ptr != text.data() + text.size()) return std::nullopt;
    return number;
}

// Seconds with a decimal point, not negative, to the nanosecond.
std::optional<int64_t> secondsIn(std::string_view text);

// "phc:/dev/ptp0" after "phc:" is "/dev/ptp0"; nothing if that is not what it begins with, or all.
inline std::optional<std::string> afterPrefix(const std::string& text, std::string_view prefix)
{
    if (text.size() <= prefix.size() || text.compare(0, prefix.size(), prefix) != 0)
        return std::nullopt;
    return text.substr(prefix.size());
}

// "; did you mean X?" with the likeliest of the words for a misspelt one; "" if none is like it.
std::string didYouMean(std::string_view word, const std::vector<std::string>& words);

} // namespace dravikHost
