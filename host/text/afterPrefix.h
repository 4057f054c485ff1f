#pragma once

#include <optional>
#include <string>
#include <string_view>

// "phc:/dev/ptp0" after "phc:" is "/dev/ptp0"; nothing if that is not what it begins with, or all.
inline std::optional<std::string> afterPrefix(const std::string& text, std::string_view prefix)
{
    if (text.size() <= prefix.size() || text.compare(0, prefix.size(), prefix) != 0)
        return std::nullopt;
    return text.substr(prefix.size());
}
