#include "verbs/run.h"

#include "clocks/systemTime.h"
#include "loop/tDiscipline.h"
#include "sources/tLiveSource.h"

#include <fmt/format.h>

#include <memory>

namespace {

struct tOptions : tDisciplineOptions {
    tInitialError initialError;
    int64_t intervalNs = 0;
    int64_t durationNs = 0; // 0: until the signal
};

void run(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    const tStopSignal stop;
    const uint64_t startNs =
        systemTimeNs(CLOCK_REALTIME) + static_cast<uint64_t>(options.initialError.offsetNs);
    tSoftClock clock(startNs, options.initialError.frequencyPpb, options.maxFrequencyOffsetPpb);
    const auto duration = options.durationNs > 0 ? std::optional(options.durationNs) : std::nullopt;
    tLiveSource source(clock, stop, options.intervalNs, duration);
    tDiscipline(library, clock, options)
        .run(fmt::format("run: clock {}; {}", options.initialError.text(), library.path), source);
}

} // namespace

tVerb addRun(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("run", "Discipline a soft clock in real time");
    const auto options = std::make_shared<tOptions>();
    addInitialErrorOptions(*verb, options->initialError, "3ms");
    addDisciplineOptions(*verb, *options);
    addQuantity(*verb, options->intervalNs,
                {"--interval", kDuration, "125ms", "1ms", "24h", "Time from pair to pair"});
    addQuantity(*verb, options->durationNs,
                {"--duration", kDuration, "", "1ns", "438300h", "Else until SIGINT or SIGTERM"});
    return {verb, [options] { run(*options); }};
}
