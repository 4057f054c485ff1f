#include "traces/iTraceFormat.h"

#include "text/quantity.h"
#include "text/words.h"

#include <array>
#include <cmath>

namespace dravikHost {

namespace {

// chrony's refclocks.log, one line a measurement:
//
//     2026-11-23 14:33:27.000000 PPS0    7 N 1  4.900000e-07 -6.741777e-07  1.000e-06
//
// with date and time, the name of the reference clock, its place in the polling interval, leap
// status, pulse, raw offset, cooked offset, dispersion. Cooked is corrected by the configured
// offset; it is in seconds and positive if the local clock is slow. Lines with "-" in place of the
// place are what the filter made of several measurements. What was done to the clock is told
// elsewhere.
class tRefclocksLogFormat : public iTraceFormat
{
public:
    const char* name() const override { return "chrony's refclocks.log"; }
    bool recognises(std::string_view line) const override;
    std::string read(std::string_view line, tRecordingBuilder& builder) override;
};

enum tWord { kDate, kTime, kName, kPlace, kLeap, kPulse, kRaw, kCooked, kDispersion, kWords };

using tWords = std::array<std::string_view, kWords>;

tWords split(std::string_view line)
{
    tWords words;
    for (std::string_view& word : words)
        word = takeWord(line);
    return words;
}

bool isFrame(std::string_view line)
{
    return line.empty() || line.substr(0, 3) == "===" ||
           line.find("Date (UTC) Time") != std::string_view::npos;
}

// Days since 1970-01-01 of the Gregorian calendar, counted in years that start in March.
int64_t daysOf(int64_t year, int64_t month, int64_t day)
{
    const int64_t shifted = month > 2 ? year : year - 1;
    const int64_t dayOfYear = (153 * (month + (month > 2 ? -3 : 9)) + 2) / 5 + day - 1;
    return 365 * shifted + shifted / 4 - shifted / 100 + shifted / 400 + dayOfYear - 719'468;
}

// "2026-11-23" and "14:33:27.000000", from 1970 to 2262.
std::optional<int64_t> momentNs(std::string_view date, std::string_view time)
{
    if (date.size() != 10 || date[4] != '-' || date[7] != '-') return std::nullopt;
    if (time.size() < 8 || time[2] != ':' || time[5] != ':') return std::nullopt;
    const auto year = numberIn<uint32_t>(date.substr(0, 4));
    const auto month = numberIn<uint32_t>(date.substr(5, 2));
    const auto day = numberIn<uint32_t>(date.substr(8));
    const auto hour = numberIn<uint32_t>(time.substr(0, 2));
    const auto minute = numberIn<uint32_t>(time.substr(3, 2));
    const auto secondNs = secondsIn(time.substr(6));
    if (!year || !month || !day || !hour || !minute || !secondNs) return std::nullopt;
    if (*year < 1970 || *year > 2261 || *month < 1 || *month > 12) return std::nullopt;
    const int64_t minutes = (daysOf(*year, *month, *day) * 24 + *hour) * 60 + *minute;
    return minutes * 60'000'000'000 + *secondNs;
}

bool tRefclocksLogFormat::recognises(std::string_view line) const
{
    const tWords words = split(line);
    return momentNs(words[kDate], words[kTime]) && !words[kDispersion].empty();
}

std::string tRefclocksLogFormat::read(std::string_view line, tRecordingBuilder& builder)
{
    constexpr double kMostSeconds = 1e9; // thirty years, still exact in nanoseconds of 64 bits
    if (isFrame(line)) return "";
    const tWords words = split(line);
    const auto timeNs = momentNs(words[kDate], words[kTime]);
    const auto slowSeconds = numberIn<double>(words[kCooked]);
    if (!timeNs || !slowSeconds || !(std::fabs(*slowSeconds) < kMostSeconds))
        return "no measurement";
    if (words[kPlace] == "-") return "made of several measurements";
    tRecordedPair pair{};
    pair.elapsedNs = *timeNs;
    pair.errorNs = -nsOf(*slowSeconds);
    pair.referenceNs = static_cast<uint64_t>(*timeNs);
    pair.clockNs = pair.referenceNs + static_cast<uint64_t>(std::llround(pair.errorNs));
    return builder.add(words[kName], pair);
}

} // namespace

std::unique_ptr<iTraceFormat> refclocksLogFormat()
{
    return std::make_unique<tRefclocksLogFormat>();
}

} // namespace dravikHost
