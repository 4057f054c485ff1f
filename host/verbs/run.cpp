#include "verbs/run.h"

#include "clocks/systemTime.h"
#include "loop/tLiveRun.h"
#include "sources/tLiveSource.h"

#include <fmt/format.h>

#include <memory>

namespace {

struct tOptions : tLiveRunOptions {
    tInitialError initialError;
    int64_t intervalNs = 0;
    int64_t durationNs = 0; // 0: until the signal
};

void run(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.discipline.library));
    tSignals signals;
    const uint64_t startNs =
        systemTimeNs(CLOCK_REALTIME) + static_cast<uint64_t>(options.initialError.offsetNs);
    tSoftClock clock(startNs, options.initialError.frequencyPpb,
                     options.discipline.maxFrequencyOffsetPpb);
    const auto duration = options.durationNs > 0 ? std::optional(options.durationNs) : std::nullopt;
    tLiveSource source(clock, signals, options.intervalNs, duration);
    tLiveRun(library, clock, signals, options)
        .run(fmt::format("run: clock {}; {}", options.initialError.text(), library.path), source);
}

void addGuardOptions(CLI::App& app, tOptions& options)
{
    app.add_flag("--dry-run", options.guards.dryRun,
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
                 "Silence of the reference that is a holdover"});
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
        ->type_name("FILE");
}

} // namespace

tVerb addRun(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("run", "Discipline a clock in real time");
    const auto options = std::make_shared<tOptions>();
    addInitialErrorOptions(*verb, options->initialError, "3ms");
    addDisciplineOptions(*verb, options->discipline);
    addQuantity(*verb, options->intervalNs,
                {"--interval", kDuration, "125ms", "1ms", "24h", "Time from pair to pair"});
    addQuantity(*verb, options->durationNs,
                {"--duration", kDuration, "", "1ns", "438300h", "Else until SIGINT or SIGTERM"});
    addGuardOptions(*verb, *options);
    addSilenceOptions(*verb, *options);
    addMonitorOptions(*verb, options->monitor);
    return {verb, [options] { run(*options); }};
}
