#include "traces/iTraceFormat.h"

#include "text/words.h"
#include "traces/lineShape.h"
#include "traces/moments.h"

#include <array>
#include <cmath>

namespace dravikHost {

namespace {

// The logs of chronyd and ntpd: words of fixed meaning behind date and time, known by the shape of
// all of them.
//
// Signs, made positive for a clock that is ahead: chronyd's refclocks.log and measurements.log and
// all of ntpd tell by how much the clock is behind, its other logs by how much it is ahead.
constexpr size_t kNone = 0; // the first word is never one of these

struct tShapedLog {
    const char* name;
    const char* shape;
    const char* banner; // a part of the line of titles; "": there is none
    size_t sourceAt;    // kNone: one series, whoever its reference was
    size_t errorAt;
    double errorNs; // of one of it, positive if ahead
    size_t frequencyAt;
    double orderedPpb; // of one of it
    bool slewed;       // each error found is slewed away before the next one
    std::string_view (*event)(const tWords& words); // why there is no error, "" if there is
};

std::string_view always(const tWords& /*words*/) { return ""; }

// What the filter made of the lines before.
std::string_view filtered(const tWords& words) { return words[3] == "-" ? "filtered" : ""; }

std::string_view unsynchronised(const tWords& words)
{
    return words.size() > 7 && words[7] == "?" ? "not synchronised" : "";
}

// A packet that failed one of the tests has no offset; zero stands in its place.
std::string_view failed(const tWords& words)
{
    const auto hasFailed = [](std::string_view tests) {
        return tests.find('0') != std::string_view::npos;
    };
    const bool bad = hasFailed(words[5]) || hasFailed(words[6]);
    return bad && finiteIn(words[11]) == 0.0 ? "a packet that failed" : "";
}

constexpr std::array<tShapedLog, 6> kLogs = {{
    {"chrony's refclocks.log", "DTnIlIEee", "Cooked offset", 2, 7, -1e9, kNone, 0, false, filtered},
    {"chrony's statistics.log", "DTneeeeeeiii|f", "Est offset", 2, 4, 1e9, kNone, 0, false, always},
    {"chrony's measurements.log", "DTnlibbbiifeeeee|h|u|u|u", "L St", 2, 11, -1e9, kNone, 0, false,
     failed},
    {"chrony's tracking.log", "DTniffe|li|ee|eee", "Freq ppm", kNone, 6, 1e9, 4, -1e3, true,
     unsynchronised},
    {"ntpd's loopstats", "msxfxxi", "", kNone, 2, -1e9, 3, 1e3, false, always},
    {"ntpd's peerstats", "msnHxxx|x", "", 2, 4, -1e9, kNone, 0, false, always},
}};
// The loopstats of xntpd end with the time constant.
constexpr std::string_view kOldLoopstats = "msxfi";

class tShapedFormat : public iTraceFormat
{
public:
    explicit tShapedFormat(const tShapedLog& log) : log(log) {}

    std::string name() const override { return log.name; }
    tLine read(std::string_view line, tRecordingBuilder& builder) override;

private:
    bool beginsWith(std::string_view word) const; // a measurement
    std::string misfitOf(const tWords& words) const;
    tLine withoutPrefix(tWords& words) const;
    std::optional<int64_t> momentOf(const tWords& words);

    const tShapedLog& log;
    tMoments moments;
    size_t mostWords = 0; // so far
};

bool isBanner(const tWords& words)
{
    return words.size() > 2 && words[0] == "Date" && words[1] == "(UTC)";
}

bool tShapedFormat::beginsWith(std::string_view word) const
{
    return log.shape[0] == 'm' ? numberIn<uint32_t>(word).has_value()
                               : word.size() == 10 && word[4] == '-' && word[7] == '-';
}

std::string tShapedFormat::misfitOf(const tWords& words) const
{
    const std::string why = misfit(words, log.shape);
    const bool old = !why.empty() && log.errorAt == 2 && misfit(words, kOldLoopstats).empty();
    return old ? "" : why;
}

std::optional<int64_t> tShapedFormat::momentOf(const tWords& words)
{
    return log.shape[0] == 'm' ? moments.ofJulian(words[0], words[1])
                               : moments.ofDate(words[0], words[1]);
}

// Takes away what a system log or ts put in front of a measurement.
tLine tShapedFormat::withoutPrefix(tWords& words) const
{
    constexpr size_t kMostOfPrefix = 5; // words
    constexpr size_t kTelling = 4;      // words that other logs do not have like this
    std::string why;
    bool damaged = false;
    for (size_t cut = 0; cut <= kMostOfPrefix && cut + 1 < words.size(); ++cut) {
        if (!beginsWith(words[cut])) continue;
        tWords rest(words.begin() + static_cast<std::ptrdiff_t>(cut), words.end());
        const std::string misfits = misfitOf(rest);
        if (misfits.empty()) {
            words = std::move(rest);
            return {tLine::kMeasurement, ""};
        }
        damaged = damaged || fittingWords(rest, log.shape) >= kTelling;
        if (why.empty()) why = misfits;
    }
    if (damaged) return tLine::unread(why);
    return tLine::foreign(why.empty() ? "no date" : why);
}

tLine tShapedFormat::read(std::string_view line, tRecordingBuilder& builder)
{
    tWords words = wordsOf(line);
    if (words.empty() || words[0].substr(0, 3) == "===") return {tLine::kFrame, ""};
    if (isBanner(words)) {
        const bool own = line.find(log.banner) != std::string_view::npos;
        return {own ? tLine::kFrame : tLine::kEvent, ""};
    }
    tLine shaped = withoutPrefix(words);
    if (shaped.kind != tLine::kMeasurement) return shaped;
    if (words.size() < mostWords) return tLine::unread("cut short");
    mostWords = words.size();
    if (!log.event(words).empty()) return {tLine::kEvent, std::string(log.event(words))};
    const auto momentNs = momentOf(words);
    const double errorNs = *finiteIn(words[log.errorAt]) * log.errorNs;
    if (!momentNs || !(std::fabs(errorNs) < kMostErrorNs)) return tLine::unread("no measurement");
    tRecordedPair pair = pairOf(*momentNs, errorNs, 0);
    if (log.frequencyAt != kNone)
        pair.orderedPpb = *finiteIn(words[log.frequencyAt]) * log.orderedPpb;
    if (log.slewed) pair.stepNs = -std::llround(errorNs);
    return tLine::added(builder.add(log.sourceAt == kNone ? "" : words[log.sourceAt], pair));
}

} // namespace

void addShapedFormats(std::vector<tMakeFormat>& formats)
{
    for (const tShapedLog& log : kLogs) {
        formats.emplace_back(
            [&log](const tReadOptions&) { return std::make_unique<tShapedFormat>(log); });
    }
}

} // namespace dravikHost
