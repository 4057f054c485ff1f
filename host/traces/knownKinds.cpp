#include "traces/knownKinds.h"

#include "traces/lineShape.h"
#include "traces/logMessage.h"

#include <algorithm>
#include <array>

namespace dravikHost {

namespace {

bool begins(std::string_view line, std::string_view with)
{
    const size_t start = std::min(line.find_first_not_of(" \t"), line.size());
    return line.substr(start, with.size()) == with;
}

template <size_t size>
bool beginsWithOneOf(std::string_view line, const std::array<const char*, size>& beginnings)
{
    return std::any_of(beginnings.begin(), beginnings.end(),
                       [line](std::string_view with) { return begins(line, with); });
}

bool contains(std::string_view line, std::string_view part)
{
    return line.find(part) != std::string_view::npos;
}

bool isShaped(std::string_view line, std::string_view shape)
{
    return misfit(wordsOf(line), shape).empty();
}

// The first words only.
bool beginsShaped(std::string_view line, std::string_view shape)
{
    tWords words = wordsOf(line);
    if (words.size() < shape.size()) return false;
    words.resize(shape.size());
    return misfit(words, shape).empty();
}

bool isUnstamped(std::string_view line)
{
    const tLogMessage message = messageIn(line);
    const size_t open = line.find_first_of("[.");
    const bool damagedStamp =
        open != std::string_view::npos && line[open] == '[' &&
        line.substr(open, line.find(']', open) - open).find('.') < line.size();
    if (!message.seconds.empty() || damagedStamp) return false;
    const tWords words = wordsOf(message.text);
    for (size_t i = 0; i + 4 < words.size(); ++i) {
        if (words[i] == "offset" && words[i + 3] == "freq" && finiteIn(words[i + 1])) return true;
        if (words[i] == "rms" && words[i + 2] == "max" && finiteIn(words[i + 1])) return true;
    }
    return false;
}

bool isChronycTracking(std::string_view line)
{
    static constexpr std::array kNames = {"Reference ID", "Ref time (UTC)", "System time",
                                          "Last offset",  "RMS offset",     "Residual freq"};
    return contains(line, " : ") && beginsWithOneOf(line, kNames);
}

bool isChronycSources(std::string_view line)
{
    const bool row = line.size() > 3 && contains("^=#", line.substr(0, 1)) &&
                     contains("*+-?x~ ", line.substr(1, 1)) && line[2] == ' ' &&
                     contains(line, "+/-");
    return row || begins(line, "MS Name/IP address");
}

bool isPmc(std::string_view line)
{
    return begins(line, "sending: GET") || contains(line, "RESPONSE MANAGEMENT") ||
           begins(line, "offsetFromMaster ") || begins(line, "master_offset ");
}

struct tKind {
    bool (*is)(std::string_view line);
    const char* what; // and what to do
};

// The special ones first.
constexpr std::array<tKind, 20> kKinds = {{
    {isUnstamped, "lines of ptp4l, phc2sys or ts2phc without the time in front; metrics reads them "
                  "with --interval, if they are evenly spaced"},
    {[](std::string_view line) {
         return isShaped(line, "DTfiffiii") || contains(line, "RTC fast (s)");
     },
     "chrony's rtc.log: it compares the RTC with the clock, not the clock with a reference; give "
     "tracking.log"},
    {[](std::string_view line) {
         return isShaped(line, "DTnnoifeee") || contains(line, "S EOpts Reach");
     },
     "chrony's selection.log: its limits of each source are no errors; give measurements.log or "
     "statistics.log"},
    {[](std::string_view line) {
         return isShaped(line, "DTee") || contains(line, "Temp.        Comp.") ||
                contains(line, "Temp. Comp.");
     },
     "chrony's tempcomp.log: temperatures, no errors of a clock; give tracking.log"},
    {isChronycTracking,
     "what 'chronyc tracking' prints: one moment, no series; give chrony's tracking.log"},
    {isChronycSources,
     "what 'chronyc sources' prints: one moment, no series; give chrony's measurements.log"},
    {[](std::string_view line) { return begins(line, "Name/IP Address") && contains(line, "NP"); },
     "what 'chronyc sourcestats' prints: one moment, no series; give chrony's statistics.log"},
    {[](std::string_view line) {
         return contains(line, "remote ") && contains(line, "refid ") && contains(line, "reach");
     },
     "what 'ntpq -p' prints: one moment, no series; give ntpd's peerstats"},
    {[](std::string_view line) { return beginsShaped(line, "msnnxxxx"); },
     "ntpd's rawstats: four times of each packet; give peerstats, which has the offsets"},
    {[](std::string_view line) { return beginsShaped(line, "msiiiiii"); },
     "ntpd's sysstats: counts of packets; give loopstats"},
    {[](std::string_view line) {
         return beginsShaped(line, "msn") && contains(line, " 127.127.") &&
                !beginsShaped(line, "msnHx");
     },
     "ntpd's clockstats: what a reference clock said; give peerstats, which has the offsets"},
    {[](std::string_view line) {
         return beginsShaped(line, "msnn") && !beginsShaped(line, "msx") &&
                !beginsShaped(line, "msnH");
     },
     "ntpd's clockstats or another of its statistics without offsets; give loopstats or peerstats"},
    {[](std::string_view line) {
         return begins(line, "# ntpshmmon") ||
                (begins(line, "sample ") && wordsOf(line).size() >= 5);
     },
     "ntpshmmon's samples; run --reference shm:UNIT reads the same segment"},
    {[](std::string_view line) {
         return begins(line, "trying PPS source") || begins(line, "found PPS source") ||
                (begins(line, "source ") && contains(line, " assert "));
     },
     "ppstest's output: edges of a pulse without the time of a reference"},
    {[](std::string_view line) { return contains(line, "phc_ctl[") || contains(line, "phc_ctl:"); },
     "phc_ctl's output: single readings of a PTP clock; phc2sys -m prints a series"},
    {isPmc, "pmc's output: no time with the offsets; give what ptp4l prints"},
    {[](std::string_view line) { return contains(line, "\"__REALTIME_TIMESTAMP\" : "); },
     "journalctl -o json-pretty; give -o json or -o short-monotonic"},
    {[](std::string_view line) {
         return begins(line, "__CURSOR=") || begins(line, "__REALTIME_TIMESTAMP=");
     },
     "journalctl -o export; give -o json or -o short-monotonic"},
    {[](std::string_view line) {
         return begins(line, "sys.") || contains(line, "Time stamping parameters for");
     },
     "settings of a network device, no trace"},
    {[](std::string_view line) { return begins(line, "<!DOCTYPE") || begins(line, "<html"); },
     "a web page, no trace"},
}};

} // namespace

std::string knownKindOf(const std::vector<std::string_view>& lines)
{
    std::array<size_t, kKinds.size()> counts{};
    for (const std::string_view line : lines) {
        const auto kind = std::find_if(kKinds.begin(), kKinds.end(),
                                       [line](const tKind& known) { return known.is(line); });
        if (kind != kKinds.end()) ++counts[static_cast<size_t>(kind - kKinds.begin())];
    }
    const auto most = std::max_element(counts.begin(), counts.end());
    return *most == 0 ? "" : kKinds[static_cast<size_t>(most - counts.begin())].what;
}

} // namespace dravikHost
