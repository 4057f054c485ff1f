#include "text/words.h"
#include "traces/iTraceFormat.h"
#include "traces/knownKinds.h"
#include "traces/lineShape.h"
#include "traces/traceText.h"

#include <fmt/format.h>

#include <algorithm>
#include <cctype>
#include <memory>
#include <new>
#include <stdexcept>
#include <utility>
#include <vector>

namespace dravikHost {

namespace {

constexpr size_t kLinesLookedAt = 1000; // of those that nothing could be read from

// One format, tried on lines until it shows whether they are its own.
class tTrial
{
public:
    tTrial(const tMakeFormat& make, const tReadOptions& options) : format(make(options)) {}

    void read(std::string_view line, int64_t number)
    {
        if (!failure.empty()) return;
        builder.beginLine(number);
        try {
            const tLine read = format->read(line, builder);
            if (read.kind == tLine::kMeasurement) ++measurements;
            const size_t start = line.find_first_not_of(" \t");
            const bool says =
                start != std::string_view::npos &&
                (std::isalnum(static_cast<unsigned char>(line[start])) != 0 || line[start] == '"');
            if (read.kind == tLine::kFrame && says) ++frames;
            if (read.kind == tLine::kEvent) related += read.why.empty() ? 1 : 3;
            if (read.kind == tLine::kUnread) related += 2;
            if (!read.why.empty() && reasons.size() < 3) reasons.push_back({number, read.why});
        } catch (const std::runtime_error& error) {
            failure = error.what();
        }
    }

    std::unique_ptr<iTraceFormat> format;
    tRecordingBuilder builder;
    int64_t measurements = 0;
    int64_t frames = 0;
    int64_t related = 0;
    std::vector<tUnreadLine> reasons;
    std::string failure; // why the file cannot be read at all

    // How much the lines are like those of the format, though none is a measurement.
    std::pair<int, int64_t> likeness() const
    {
        return {frames > 0 ? 2 : failure.empty() ? 0 : 1, related};
    }
};

std::vector<tMakeFormat> allFormats()
{
    std::vector<tMakeFormat> formats;
    addCsvFormat(formats);
    addDaemonLogFormat(formats);
    addShapedFormats(formats);
    addOtherDaemonFormats(formats);
    addColumnsFormat(formats);
    return formats;
}

std::vector<tTrial> trialsOf(const std::vector<tMakeFormat>& formats, const tReadOptions& options)
{
    std::vector<tTrial> trials;
    trials.reserve(formats.size());
    for (const tMakeFormat& make : formats)
        trials.emplace_back(make, options);
    return trials;
}

// The first of those that have read the most.
template <typename Count> size_t bestOf(const std::vector<tTrial>& trials, Count count)
{
    const auto best = std::max_element(
        trials.begin(), trials.end(),
        [count](const tTrial& one, const tTrial& other) { return count(one) < count(other); });
    return static_cast<size_t>(best - trials.begin());
}

int64_t measurementsOf(const tTrial& trial) { return trial.measurements; }

// Reads until some format has read enough lines, or to the end.
void tryAll(std::vector<tTrial>& trials, std::string_view text)
{
    constexpr int64_t kEnough = 10;
    for (int64_t number = 1; !text.empty(); ++number) {
        const std::string_view line = takeLine(text);
        for (tTrial& trial : trials)
            trial.read(line, number);
        if (trials[bestOf(trials, measurementsOf)].measurements >= kEnough) return;
    }
}

std::vector<std::string_view> firstLines(std::string_view text, size_t most)
{
    std::vector<std::string_view> lines;
    while (!text.empty() && lines.size() < most) {
        const std::string_view line = takeLine(text);
        if (line.find_first_not_of(" \t") != std::string_view::npos) lines.push_back(line);
    }
    return lines;
}

std::string reasonsOf(const std::vector<tUnreadLine>& unread)
{
    std::string reasons;
    for (const tUnreadLine& line : unread)
        reasons += fmt::format("{}{} ({})", reasons.empty() ? "" : ", ", line.number, line.why);
    return reasons;
}

// Why there is not one measurement, as well as it can be told.
std::string refusalOf(std::string_view text, const std::vector<tTrial>& trials)
{
    constexpr size_t kShown = 3;
    const std::vector<std::string_view> lines = firstLines(text, kLinesLookedAt);
    if (lines.empty()) return "is empty";
    const std::string kind = knownKindOf(lines);
    if (!kind.empty()) return "is " + kind;
    const tTrial& closest =
        trials[bestOf(trials, [](const tTrial& trial) { return trial.likeness(); })];
    if (!closest.failure.empty()) return "cannot be read: " + closest.failure;
    std::string first;
    for (size_t i = 0; i < std::min(lines.size(), kShown); ++i)
        first += fmt::format("{}'{}'", i == 0 ? "" : ", ", printable(lines[i]));
    if (closest.likeness() == std::pair(0, int64_t{0}))
        return fmt::format("is no trace of a known kind; it begins with {}", first);
    return fmt::format("looks like {}, but has no measurement; {}", closest.format->name(),
                       closest.reasons.empty()
                           ? "it begins with " + first
                           : "not used are lines " + reasonsOf(closest.reasons));
}

struct tReading {
    std::unique_ptr<iTraceFormat> format;
    tRecordingBuilder builder;
    std::vector<std::string_view> unread; // the first of them
};

// Throws std::runtime_error without the name of the file.
tReading readAll(const tMakeFormat& make, std::string_view text, const tReadOptions& options)
{
    tReading reading{make(options), {}, {}};
    for (int64_t number = 1; !text.empty(); ++number) {
        const std::string_view line = takeLine(text);
        reading.builder.beginLine(number);
        const tLine read = reading.format->read(line, reading.builder);
        if (read.kind == tLine::kEvent) reading.builder.addEvent();
        if (read.kind != tLine::kUnread && read.kind != tLine::kForeign) continue;
        reading.builder.setUnread(number, read.why);
        if (reading.unread.size() < kLinesLookedAt) reading.unread.push_back(line);
    }
    reading.format->finish(reading.builder);
    return reading;
}

// Lines that mean something else must not pass as a few that are damaged.
std::string mixtureIn(const tReading& reading, size_t chosen,
                      const std::vector<tMakeFormat>& formats, const tReadOptions& options)
{
    constexpr int64_t kChance = 3;
    if (reading.unread.empty()) return "";
    std::vector<tTrial> trials = trialsOf(formats, options);
    for (size_t i = 0; i < trials.size(); ++i) {
        for (const std::string_view line : reading.unread)
            if (i != chosen) trials[i].read(line, 1);
    }
    const tTrial& other = trials[bestOf(trials, measurementsOf)];
    if (other.measurements >= kChance) {
        return fmt::format("mixes {} with {}; give one of them", reading.format->name(),
                           other.format->name());
    }
    if (reading.builder.unread() < kChance ||
        reading.builder.unread() < reading.builder.measurements())
        return "";
    const std::string kind = knownKindOf(reading.unread);
    return kind.empty() ? "" : "is mostly " + kind;
}

// Options that had no say in it.
std::string needlessIn(const tRecordingBuilder& builder, const tReadOptions& options)
{
    if (options.intervalNs && !builder.usesInterval())
        return "has times of its own; leave --interval out";
    if (options.unitNs && !builder.usesUnit()) return "has a unit of its own; leave --unit out";
    return "";
}

tRecording read(const std::string& name, const std::string& text, const tReadOptions& options)
{
    const std::vector<tMakeFormat> formats = allFormats();
    std::vector<tTrial> trials = trialsOf(formats, options);
    tryAll(trials, text);
    const size_t best = bestOf(trials, measurementsOf);
    if (trials[best].measurements == 0)
        throw std::runtime_error(fmt::format("{} {}", name, refusalOf(text, trials)));
    trials.clear();
    tReading reading = [&] {
        try {
            return readAll(formats[best], text, options);
        } catch (const std::runtime_error& error) {
            throw std::runtime_error(fmt::format("{}: {}", name, error.what()));
        }
    }();
    const std::string unfit =
        mixtureIn(reading, best, formats, options) + needlessIn(reading.builder, options);
    if (!unfit.empty()) throw std::runtime_error(fmt::format("{} {}", name, unfit));
    return reading.builder.finish(name, reading.format->name(), options.source);
}

} // namespace

tRecording readRecording(const std::string& path, const tReadOptions& options)
{
    const std::string name = path == "-" ? "the standard input" : path;
    try {
        return read(name, readTraceText(path), options);
    } catch (const std::bad_alloc&) {
        throw std::runtime_error(name + " takes more memory than there is; give a part of it");
    }
}

} // namespace dravikHost
