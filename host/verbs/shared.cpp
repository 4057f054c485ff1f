#include "verbs/shared.h"

#include "text/words.h"
#include "watchers/tReport.h"
#include "watchers/tSummary.h"
#include "watchers/tTraceFile.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstdio>
#include <stdexcept>

namespace dravikHost {

namespace {

tLaterDocument parseLater(const std::string& text)
{
    const size_t equals = text.find('=');
    if (equals == std::string::npos || equals + 1 == text.size())
        throw std::invalid_argument("'" + text + "' is not AFTER=FILE, such as 60s=a.json");
    const tQuantityOption after = {"--then", kDuration, "", "0ns", "438300h", ""};
    return {static_cast<int64_t>(parseWithin(after, text.substr(0, equals))),
            text.substr(equals + 1)};
}

// The coarsest power of two that is as fine.
int factorOf(const std::string& resolution)
{
    const double ppb =
        parseWithin({"--resolution", kFrequency, "", "0.015625ppb", "1ppb", ""}, resolution);
    int factor = 1;
    while (factor * ppb < 1)
        factor *= 2;
    return factor;
}

void addLater(std::vector<tLaterDocument>& later, const std::string& text)
{
    const tLaterDocument document = parseLater(text);
    if (!later.empty() && document.afterNs <= later.back().afterNs)
        throw std::invalid_argument("'" + text + "' does not come after the one before");
    later.push_back(document);
}

int parseHops(const std::string& text)
{
    constexpr int kMostHops = 50;
    const auto hops = numberIn<int>(text);
    if (!hops || *hops < 1 || *hops > kMostHops)
        throw std::invalid_argument(fmt::format("'{}' is not 1 to {}", text, kMostHops));
    return *hops;
}

void printUnread(const tRecording& recording)
{
    if (recording.unreadLines == 0) return;
    std::string examples;
    for (const tUnreadLine& line : recording.firstUnread)
        examples += fmt::format("{}{} ({})", examples.empty() ? "" : ", ", line.number, line.why);
    const bool all = recording.unreadLines == static_cast<int64_t>(recording.firstUnread.size());
    fmt::print(stderr, "dravik-host: {}: {} lines are not used, {} {}\n", recording.name,
               recording.unreadLines, all ? "lines" : "the first are lines", examples);
}

// The setting that prints each measurement.
std::string perMeasurement(const tRecording& recording)
{
    const auto isOf = [&recording](const char* program) {
        return recording.source.find(program) != std::string::npos;
    };
    if (isOf("phc2sys")) return "phc2sys prints each measurement with -u 0";
    if (isOf("dravik-host")) return "run prints each measurement with --status 0";
    return "ptp4l prints each measurement with summary_interval -7 (phc2sys with -u 0)";
}

void printNotes(const tRecording& recording)
{
    const auto stretches =
        1 + std::count_if(recording.pairs.begin(), recording.pairs.end(),
                          [](const tRecordedPair& pair) { return pair.beginsStretch; });
    if (stretches > 1) {
        fmt::print(stderr,
                   "dravik-host: {}: the time starts anew, as after a reboot, so there are {} "
                   "stretches\n",
                   recording.name, stretches);
    }
    for (const std::string& note : recording.notes)
        fmt::print(stderr, "dravik-host: {}: {}\n", recording.name, note);
}

} // namespace

void addTuningOptions(tOptionSet& options, tTuning& tuning)
{
    const tOption metaData =
        options.text("--metadata", "FILE", tuning.metaDataFile, "Metadata of the time reference");
    options
        .text("--reference-type", "TEXT", tuning.referenceType,
              "Metadata with no more than this type")
        .excludes(metaData);
    options.text("--config", "FILE", tuning.configFile,
                 "Configuration document; goes last, so it\n"
                 "wins over a default document of the type");
}

void requireOneInput(const tTuning& tuning)
{
    if (tuning.metaDataFile == "-" && tuning.configFile == "-")
        throw std::invalid_argument("--config: the standard input is taken by --metadata");
}

void requireOneTuning(const tOptionSet& options, const tDisciplineOptions& discipline)
{
    requireOneInput(discipline.tuning);
    if (!discipline.selfTune) return;
    if (discipline.dryRun) {
        throw std::invalid_argument(
            "--self-tune: there is nothing to learn from a dry run, whose clock follows no order");
    }
    for (const char* const option : kTuningOptions) {
        if (!options.given(option)) continue;
        throw std::invalid_argument(std::string("--self-tune: ") + option +
                                    " says how to tune; it is one or the other");
    }
}

std::string tuningText(const tDisciplineOptions& discipline)
{
    const tTuning& tuning = discipline.tuning;
    if (discipline.selfTune) return "self-tuned";
    if (tuning.configFile) return "tuned by " + *tuning.configFile;
    if (tuning.metaDataFile) return "tuned for what " + *tuning.metaDataFile + " tells";
    if (tuning.referenceType) return "tuned for the type '" + *tuning.referenceType + "'";
    return "with the built-in parameters";
}

void addHopsOption(tOptionSet& options, int& hops, const char* help)
{
    options.parsed(
        "--hops", "NUMBER", [&hops](const std::string& text) { hops = parseHops(text); }, help,
        "1");
}

void addDisciplineOptions(tOptionSet& options, tDisciplineOptions& discipline)
{
    options.quantity(discipline.maxFrequencyOffsetPpb,
                     {"--max-frequency-offset", kFrequency, "500ppm", "1ppb", "100000ppm",
                      "How far its rate can be changed"});
    options.quantity(discipline.measureOverNs,
                     {"--measure-over", kDuration, "0ns", "0ns", "24h",
                      "Least time over which the frequency is\nmeasured; pairs between are held "
                      "back"});
    const auto takeResolution = [&factor = discipline.factor](const std::string& text) {
        factor = tFineServo::kFinest;
        if (text != "finest") factor = factorOf(text);
    };
    options.parsed("--resolution", kFrequency.placeholder, takeResolution,
                   "Of orders, down to 0.015625ppb; 1ppb shows the\nservo the clock as it is",
                   "finest");
    options.repeatable(
        "--then", "AFTER=FILE",
        [&later = discipline.later](const std::string& text) { addLater(later, text); },
        "A further document once the lock has held\nso long; repeatable");
    options.text("--csv", "FILE", discipline.csv, "Every pair and host call; - is stdout");
    options.flag("--self-tune", discipline.selfTune,
                 "No document: learn noise and oscillator from\nthe pairs, and tune the servo all "
                 "the while");
    addTuningOptions(options, discipline.tuning);
    options.library(discipline.library);
}

// The bounds keep all times of a run within 64 bits: 438300 h are fifty years.
void addInitialErrorOptions(tOptionSet& options, tInitialError& error, const char* defaultOffset)
{
    options.quantity(error.offsetNs, {"--initial-offset", kDuration, defaultOffset, "-438300h",
                                      "438300h", "How far the clock is ahead at the start"});
    options.quantity(error.frequencyPpb, {"--frequency-error", kFrequency, "12ppm", "-100000ppm",
                                          "100000ppm", "How much too fast its oscillator is"});
}

std::string tInitialError::text() const
{
    return fmt::format("{} and {} off", signedDurationText(offsetNs), offsetText(frequencyPpb));
}

tOption addTraceOptions(tOptionSet& options, tTraceOptions& trace)
{
    options.text("--source", "NAME", trace.read.source,
                 "Which one, if the trace has several; a part of its name");
    return options.text("trace", "FILE", trace.file,
                        "CSV, or a log of ptp4l, phc2sys, ts2phc,\nchronyd or ntpd; - is stdin");
}

void addFreeRunningOption(tOptionSet& options, tTraceOptions& trace)
{
    options.flag("--free-running", trace.freeRunning,
                 "Where the trace tells no frequency and no\nsteps, the clock was given none");
}

tRecording readWholeTrace(const tTraceOptions& options)
{
    tRecording recording = readRecording(options.file, options.read);
    printUnread(recording);
    printNotes(recording);
    if (!options.freeRunning) return recording;
    for (tRecordedPair& pair : recording.pairs)
        pair.orderedPpb = pair.orderedPpb.value_or(0);
    return recording;
}

tRecording readTrace(const tTraceOptions& options)
{
    tRecording recording = readWholeTrace(options);
    if (recording.pairs.empty()) {
        throw std::runtime_error(
            fmt::format("{} has summaries only; {}", recording.name, perMeasurement(recording)));
    }
    const size_t before = recording.notes.size();
    keepLongestStretch(recording);
    for (size_t i = before; i < recording.notes.size(); ++i)
        fmt::print(stderr, "dravik-host: {}: {}\n", recording.name, recording.notes[i]);
    return recording;
}

void runInMadeTime(const tServoLibrary& library, iClock& clock, iPairSource& source,
                   const std::string& scenario, const tDisciplineOptions& options)
{
    tConsole console(options.csv == "-");
    tTraceFile trace(options.csv);
    tReport report(console);
    tSummary summary(console);
    tObservers observers = {&trace, &report, &summary};
    tDiscipline discipline(library, clock, options);
    disciplineAll(discipline, source, scenario, observers);
}

} // namespace dravikHost
