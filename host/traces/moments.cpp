#include "traces/moments.h"

#include "text/quantity.h"
#include "text/words.h"

#include <array>

namespace dravikHost {

namespace {

constexpr int64_t kDaySeconds = 86'400;

// Days since 1970-01-01 of the Gregorian calendar, counted in years that start in March.
int64_t daysOf(int64_t year, int64_t month, int64_t day)
{
    const int64_t shifted = month > 2 ? year : year - 1;
    const int64_t dayOfYear = (153 * (month + (month > 2 ? -3 : 9)) + 2) / 5 + day - 1;
    return 365 * shifted + shifted / 4 - shifted / 100 + shifted / 400 + dayOfYear - 719'468;
}

// Of dates that exist.
std::optional<int64_t> daysIn(std::string_view date)
{
    if (date.size() != 10 || date[4] != '-' || date[7] != '-') return std::nullopt;
    const auto year = numberIn<uint32_t>(date.substr(0, 4));
    const auto month = numberIn<uint32_t>(date.substr(5, 2));
    const auto day = numberIn<uint32_t>(date.substr(8));
    if (!year || !month || !day || *year < 1970 || *year > 2261 || *month < 1 || *month > 12)
        return std::nullopt;
    const int64_t nextMonth = *month == 12 ? daysOf(*year + 1, 1, 1) : daysOf(*year, *month + 1, 1);
    const int64_t days = daysOf(*year, *month, *day);
    if (*day < 1 || days >= nextMonth) return std::nullopt;
    return days;
}

} // namespace

std::optional<int64_t> tMoments::ofDate(std::string_view date, std::string_view time)
{
    const auto days = daysIn(date);
    if (!days || time.size() < 8 || time[2] != ':' || time[5] != ':') return std::nullopt;
    const auto hour = numberIn<uint32_t>(time.substr(0, 2));
    const auto minute = numberIn<uint32_t>(time.substr(3, 2));
    const std::string_view second = time.substr(6);
    const auto secondNs = secondsIn(second);
    if (!hour || !minute || !secondNs || *hour > 23 || *minute > 59) return std::nullopt;
    if (second.size() > 2 && second[2] != '.') return std::nullopt;
    const bool leaps = *hour == 23 && *minute == 59 && *secondNs >= 60 * kSecondNs;
    if (*secondNs >= (leaps ? 61 : 60) * kSecondNs) return std::nullopt;
    const int64_t minutes = int64_t{*hour} * 60 + *minute;
    int64_t momentNs = (*days * kDaySeconds + minutes * 60) * kSecondNs + *secondNs;
    if (leaps) {
        leapNs = (*days + 1) * kDaySeconds * kSecondNs;
    } else if (leapNs && momentNs >= *leapNs) {
        momentNs += kSecondNs;
    }
    return momentNs;
}

std::optional<int64_t> tMoments::ofIso(std::string_view text)
{
    if (text.size() < 19 || (text[10] != 'T' && text[10] != ' ')) return std::nullopt;
    if (text.back() == 'Z') text.remove_suffix(1);
    return ofDate(text.substr(0, 10), text.substr(11));
}

std::optional<int64_t> tMoments::ofJulian(std::string_view day, std::string_view seconds)
{
    constexpr uint32_t kFirstDay = 40'587; // 1970-01-01
    constexpr uint32_t kLastDay = 147'000; // in 2261
    const auto days = numberIn<uint32_t>(day);
    const auto secondsNs = secondsIn(seconds);
    if (!days || !secondsNs || *days < kFirstDay || *days > kLastDay) return std::nullopt;
    if (*secondsNs > (kDaySeconds + 1) * kSecondNs) return std::nullopt;
    return (*days - kFirstDay) * kDaySeconds * kSecondNs + *secondsNs;
}

} // namespace dravikHost
