#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

namespace dravikHost {

// Dates and times of day as moments since 1970, in ns, from 1970 to 2261.
class tMoments
{
public:
    // "2026-11-23" and "14:33:27.000000". Once a leap second was met, 23:59:60, what follows it is
    // one second later, so that time goes on evenly. Nothing if there is no such date or time.
    std::optional<int64_t> ofDate(std::string_view date, std::string_view time);

    // The same in one word: "2026-11-23T14:33:27Z".
    std::optional<int64_t> ofIso(std::string_view text);

    // A modified Julian date and the seconds of that day.
    std::optional<int64_t> ofJulian(std::string_view day, std::string_view seconds);

private:
    std::optional<int64_t> leapNs; // the end of the leap second, without it
};

} // namespace dravikHost
