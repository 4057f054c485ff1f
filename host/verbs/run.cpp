#include "verbs/run.h"

#include "clocks/openClock.h"
#include "loop/tLiveRun.h"
#include "sources/openReference.h"
#include "sources/tLiveSource.h"

#include <fmt/format.h>

#include <algorithm>
#include <memory>

namespace {

struct tOptions : tLiveRunOptions {
    std::string reference = "realtime";
    std::string clock = "soft";
    tInitialError initialError; // of the soft clock
    int64_t intervalNs = 0;     // of a reference that is read on demand
    tLiveSource::tOptions source;
};

std::string scenarioText(const tOptions& options, const tServoLibrary& library)
{
    const std::string start =
        options.clock == "soft" ? ", " + options.initialError.text() : std::string();
    return fmt::format("run: clock {}{}; reference {}; {}", options.clock, start, options.reference,
                       library.path);
}

// What is read on demand is silent only when readings fail.
tLiveRunOptions patient(const tOptions& options)
{
    tLiveRunOptions patient = static_cast<const tLiveRunOptions&>(options);
    if (!isReadOnDemand(options.reference)) return patient;
    constexpr int64_t kReadings = 3;
    patient.silenceNs = std::max(options.silenceNs, kReadings * options.intervalNs);
    patient.longHoldoverNs = std::max(options.longHoldoverNs, patient.silenceNs);
    return patient;
}

void run(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.discipline.library));
    tSignals signals;
    const auto clock =
        openClock({options.clock, options.discipline.maxFrequencyOffsetPpb,
                   options.initialError.offsetNs, options.initialError.frequencyPpb});
    const auto reference = openReference(options.reference, options.intervalNs);
    tLiveSource source(*clock, *reference, signals, options.source);
    const tLiveRunOptions live = patient(options);
    tLiveRun(library, *clock, signals, live).run(scenarioText(options, library), source);
}

void addReferenceOptions(CLI::App& app, tOptions& options)
{
    app.add_option("--reference", options.reference,
                   "realtime, phc:DEVICE, shm:UNIT (a segment of\nNTP) or sock:PATH (datagrams)")
        ->type_name("NAME")
        ->capture_default_str()
        ->check([](const std::string& name) {
            return isReferenceName(name) ? "" : "'" + name + "' is no reference; see --help";
        });
    addQuantity(app, options.source.referenceOffsetNs,
                {"--reference-offset", kDuration, "0ns", "-438300h", "438300h",
                 "Added to what it says, such as -37s from TAI\nto UTC"});
    addQuantity(
        app, options.intervalNs,
        {"--interval", kDuration, "125ms", "1ms", "24h", "How often realtime and phc are read"});
}

void addClockOptions(CLI::App& app, tOptions& options)
{
    app.add_option("--clock", options.clock,
                   "soft (the program's own), phc:DEVICE or\nrealtime (the machine's)")
        ->type_name("NAME")
        ->capture_default_str()
        ->check([](const std::string& name) {
            return isClockName(name) ? "" : "'" + name + "' is no clock; see --help";
        });
    addInitialErrorOptions(app, options.initialError, "3ms");
}

// What would have no effect is a mistake.
void requireConsistency(const CLI::App& app, const tOptions& options)
{
    if (options.reference == options.clock)
        throw CLI::ValidationError("--clock", options.clock + " is its own reference");
    if (app.count("--interval") > 0 && !isReadOnDemand(options.reference))
        throw CLI::ValidationError("--interval", options.reference + " has a pace of its own");
    for (const char* const option : {"--initial-offset", "--frequency-error"}) {
        if (app.count(option) > 0 && options.clock != "soft")
            throw CLI::ValidationError(option, "only the soft clock starts as one likes");
    }
}

void addGuardOptions(CLI::App& app, tOptions& options)
{
    app.add_flag("--dry-run", options.discipline.dryRun,
                 "Order nothing: look at what would be ordered");
    addQuantity(app, options.guards.maxStepNs,
                {"--max-step", kDuration, "", "0ns", "438300h", "End rather than step by more"});
    app.add_flag("--no-step-after-lock", options.guards.noStepAfterLock,
                 "End rather than step again");
    addQuantity(app, options.sanityLimitPpb,
                {"--sanity-limit", kFrequency, "200000ppm", "1ppb", "1000000ppm",
                 "Measure anew if reference or clock leap by\nmore against CLOCK_MONOTONIC_RAW"});
}

void addSilenceOptions(CLI::App& app, tOptions& options)
{
    addQuantity(app, options.silenceNs,
                {"--holdover-after", kDuration, "10s", "1ms", "24h",
                 "Silence of the reference that is a holdover,\nand three intervals at least"});
    addQuantity(app, options.longHoldoverNs,
                {"--remeasure-after", kDuration, "1h", "1ms", "438300h",
                 "Holdover after which to measure anew"});
}

void addMonitorOptions(CLI::App& app, tRunMonitor::tOptions& monitor)
{
    addQuantity(
        app, monitor.statusIntervalNs,
        {"--status", kDuration, "", "0ns", "24h", "A line each time; 0 is one for each pair"});
    app.add_option("--metrics", monitor.metricsFile,
                   "Figures for a monitoring agent, replaced as a\nwhole once a second")
        ->type_name("FILE")
        ->check([](const std::string& file) {
            return file == "-" ? "the figures are replaced as a whole, which takes a file" : "";
        });
}

} // namespace

tVerb addRun(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("run", "Discipline a clock in real time");
    const auto options = std::make_shared<tOptions>();
    addReferenceOptions(*verb, *options);
    addClockOptions(*verb, *options);
    addDisciplineOptions(*verb, options->discipline);
    addQuantity(*verb, options->source.durationNs,
                {"--duration", kDuration, "", "1ns", "438300h", "Else until SIGINT or SIGTERM"});
    addGuardOptions(*verb, *options);
    addSilenceOptions(*verb, *options);
    addMonitorOptions(*verb, options->monitor);
    verb->parse_complete_callback([verb, options] { requireConsistency(*verb, *options); });
    return {verb, [options] { run(*options); }};
}
