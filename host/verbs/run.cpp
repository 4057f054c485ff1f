#include "verbs/verbs.h"

#include "clocks/openClock.h"
#include "loop/tLiveRun.h"
#include "sources/iReference.h"
#include "sources/tLiveSource.h"
#include "verbs/shared.h"
#include "watchers/tMetricsFile.h"
#include "watchers/tReport.h"
#include "watchers/tStatusLines.h"
#include "watchers/tSummary.h"
#include "watchers/tTraceFile.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <memory>
#include <stdexcept>

namespace dravikHost {

namespace {

struct tRun : tLiveRunOptions {
    std::string reference = "realtime";
    std::string clock = "soft";
    tInitialError initialError; // of the soft clock
    int64_t intervalNs = 0;     // of a reference that is read on demand
    tLiveSource::tOptions source;
    std::optional<int64_t> statusIntervalNs; // 0: a line for each pair
    std::string metricsFile;
};

std::string scenarioText(const tRun& options, const tServoLibrary& library)
{
    const std::string start =
        options.clock == "soft" ? ", " + options.initialError.text() : std::string();
    return fmt::format("run: clock {}{}; reference {}; {}; {}", options.clock, start,
                       options.reference, tuningText(options.discipline), library.path);
}

// What is read on demand is silent only when readings fail.
tLiveRunOptions patient(const tRun& options)
{
    tLiveRunOptions patient = static_cast<const tLiveRunOptions&>(options);
    if (!isReadOnDemand(options.reference)) return patient;
    constexpr int64_t kReadings = 3;
    patient.silenceNs = std::max(options.silenceNs, kReadings * options.intervalNs);
    patient.longHoldoverNs = std::max(options.longHoldoverNs, patient.silenceNs);
    return patient;
}

void run(const tRun& options)
{
    const tServoLibrary library(tServoLibrary::find(options.discipline.library));
    tSignals signals;
    const auto clock = openClock({options.clock, options.discipline.maxFrequencyOffsetPpb,
                                  options.initialError.offsetNs, options.initialError.frequencyPpb,
                                  !options.discipline.dryRun});
    const auto reference = openReference(options.reference, options.intervalNs);
    tLiveSource source(*clock, *reference, signals, options.source);

    tConsole console(options.discipline.csv == "-");
    tTraceFile trace(options.discipline.csv);
    tReport report(console);
    tStatusLines status(options.statusIntervalNs, console);
    tMetricsFile metrics(options.metricsFile, console);
    tSummary summary(console);
    tObservers observers = {&trace, &report, &status, &metrics, &summary};

    const tLiveRunOptions live = patient(options);
    tLiveRun(library, *clock, signals, live, observers).run(scenarioText(options, library), source);
}

void addReferenceOptions(tOptionSet& options, tRun& run)
{
    const auto take = [&run](const std::string& name) {
        if (!isReferenceName(name))
            throw std::invalid_argument("'" + name + "' is not a reference; see --help");
        run.reference = name;
    };
    options.parsed("--reference", "NAME", take,
                   "realtime, phc:DEVICE, shm:UNIT (a segment of\nNTP) or sock:PATH (datagrams)",
                   run.reference);
    options.quantity(run.source.referenceOffsetNs,
                     {"--reference-offset", kDuration, "0ns", "-438300h", "438300h",
                      "Added to what it says, such as -37s from TAI\nto UTC"});
    options.quantity(run.intervalNs, {"--interval", kDuration, "125ms", "1ms", "24h",
                                      "How often realtime and phc are read"});
}

void addClockOptions(tOptionSet& options, tRun& run)
{
    const auto take = [&run](const std::string& name) {
        if (!isClockName(name))
            throw std::invalid_argument("'" + name + "' is not a clock; see --help");
        run.clock = name;
    };
    options.parsed("--clock", "NAME", take,
                   "soft (the program's own), phc:DEVICE or\nrealtime (the machine's)", run.clock);
    addInitialErrorOptions(options, run.initialError, "3ms");
}

// What would have no effect is a mistake.
void requireConsistency(const tOptionSet& options, const tRun& run)
{
    requireOneTuning(options, run.discipline);
    if (run.reference == run.clock)
        throw std::invalid_argument("--clock: " + run.clock + " is its own reference");
    if (options.given("--interval") && !isReadOnDemand(run.reference))
        throw std::invalid_argument("--interval: " + run.reference + " has a pace of its own");
    for (const char* const option : {"--initial-offset", "--frequency-error"}) {
        if (options.given(option) && run.clock != "soft") {
            throw std::invalid_argument(std::string(option) +
                                        ": only the soft clock starts as one likes");
        }
    }
}

// Nobody knows the noise beforehand: who names no tuning leaves it to the program.
void tuneItself(const tOptionSet& options, tDisciplineOptions& discipline)
{
    const bool tuned = std::any_of(std::begin(kTuningOptions), std::end(kTuningOptions),
                                   [&options](const char* name) { return options.given(name); });
    if (!tuned && !discipline.dryRun) discipline.selfTune = true;
}

void addGuardOptions(tOptionSet& options, tRun& run)
{
    options.flag("--dry-run", run.discipline.dryRun,
                 "Order nothing: look at what would be ordered");
    options.quantity(run.maxStepNs, {"--max-step", kDuration, "", "0ns", "438300h",
                                     "End rather than step by more"});
    options.flag("--no-step-after-lock", run.noStepAfterLock, "End rather than step again");
    options.quantity(run.sanityLimitPpb,
                     {"--sanity-limit", kFrequency, "200000ppm", "1ppb", "1000000ppm",
                      "Measure anew if reference or clock leap by\nmore against "
                      "CLOCK_MONOTONIC_RAW"});
}

void addSilenceOptions(tOptionSet& options, tRun& run)
{
    options.quantity(run.silenceNs,
                     {"--holdover-after", kDuration, "10s", "1ms", "24h",
                      "Silence of the reference that is a holdover,\nand three intervals at "
                      "least"});
    options.quantity(run.longHoldoverNs, {"--remeasure-after", kDuration, "1h", "1ms", "438300h",
                                          "Holdover after which to measure anew"});
}

void addWatcherOptions(tOptionSet& options, tRun& run)
{
    options.quantity(run.statusIntervalNs, {"--status", kDuration, "", "0ns", "24h",
                                            "A line each time; 0 is one for each pair"});
    const auto takeFile = [&run](const std::string& file) {
        if (file == "-") {
            throw std::invalid_argument("the figures are replaced as a whole, which takes a file");
        }
        run.metricsFile = file;
    };
    options.parsed("--metrics", "FILE", takeFile,
                   "Figures for a monitoring agent, replaced as a\nwhole once a second");
}

} // namespace

std::function<void()> addRun(tOptionSet& options)
{
    const auto run = std::make_shared<tRun>();
    addReferenceOptions(options, *run);
    addClockOptions(options, *run);
    addDisciplineOptions(options, run->discipline);
    options.quantity(run->source.durationNs, {"--duration", kDuration, "", "1ns", "438300h",
                                              "Else until SIGINT or SIGTERM"});
    addHopsOption(options, run->discipline.hops,
                  "Tune itself for the last of so many clocks in\na row, all held like this one");
    addGuardOptions(options, *run);
    addSilenceOptions(options, *run);
    addWatcherOptions(options, *run);
    options.finally([run, options] {
        requireConsistency(options, *run);
        tuneItself(options, run->discipline);
        if (run->discipline.hops > 1 && !run->discipline.selfTune)
            throw std::invalid_argument("--hops: it is self-tuning that would mind them");
    });
    return [run] { dravikHost::run(*run); };
}

} // namespace dravikHost
