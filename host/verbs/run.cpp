#include "verbs/run.h"

#include "clocks/systemTime.h"
#include "loop/discipline.h"
#include "sources/tLiveSource.h"

#include <fmt/format.h>

#include <memory>

namespace {

struct tOptions : tCommonOptions {
    int64_t intervalNs = 0;
    int64_t durationNs = 0; // 0: until the signal
};

void run(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    const tStopSignal stop;
    const uint64_t startNs =
        systemTimeNs(CLOCK_REALTIME) + static_cast<uint64_t>(options.initialOffsetNs);
    tSoftClock clock(startNs, options.frequencyErrorPpb, options.maxFrequencyOffsetPpb);
    const auto duration = options.durationNs > 0 ? std::optional(options.durationNs) : std::nullopt;
    tLiveSource source(clock, stop, options.intervalNs, duration);
    const std::string scenario =
        fmt::format("run: clock {} and {} off; {}",
                    signedDurationText(static_cast<double>(options.initialOffsetNs)),
                    offsetText(options.frequencyErrorPpb), library.path);
    discipline(library, clock, source, scenario, options);
}

} // namespace

tVerb addRun(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("run", "Discipline a soft clock in real time");
    const auto options = std::make_shared<tOptions>();
    addCommonOptions(*verb, *options, "3ms");
    addQuantity(*verb, options->intervalNs,
                {"--interval", kDuration, "125ms", "1ms", "24h", "Time from pair to pair"});
    addQuantity(*verb, options->durationNs,
                {"--duration", kDuration, "", "1ns", "438300h", "Else until SIGINT or SIGTERM"});
    return {verb, [options] { run(*options); }};
}
