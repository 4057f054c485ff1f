#include "verbs/simulate.h"

#include "loop/tDiscipline.h"
#include "sources/tSimulatedSource.h"

#include <fmt/format.h>

#include <charconv>
#include <memory>

namespace {

struct tOptions : tDisciplineOptions {
    tInitialError initialError;
    tOscillatorModel oscillator;
    tMeasurementModel measurement;
    uint64_t seed = 1;
};

void addMeasurementOptions(CLI::App& app, tMeasurementModel& model)
{
    addQuantity(app, model.intervalNs,
                {"--interval", kDuration, "1s", "1ns", "24h", "Time from pair to pair"});
    addQuantity(app, model.durationNs,
                {"--duration", kDuration, "5min", "1ns", "438300h", "Simulated time"});
    addQuantity(app, model.noiseNs,
                {"--noise", kDuration, "20ns", "0ns", "24h", "White, of measurements; deviation"});
    addQuantity(app, model.outlierRate,
                {"--outlier-rate", kRatio, "0%", "0%", "100%", "Share of measurements far off"});
    addQuantity(app, model.outlierSizeNs,
                {"--outlier-size", kDuration, "0ns", "0ns", "24h", "How far they are off"});
    addQuantity(app, model.granularityNs,
                {"--granularity", kDuration, "1ns", "1ns", "24h",
                 "Timestamps are cut down to its multiples"});
}

void addOscillatorOptions(CLI::App& app, tOscillatorModel& model)
{
    addQuantity(app, model.frequencyNoisePpb,
                {"--frequency-noise", kFrequency, "0.1ppb", "0ppb", "1000ppm",
                 "White; Allan deviation at 1 s"});
    addQuantity(app, model.frequencyWanderPpb,
                {"--frequency-wander", kFrequency, "0.01ppb", "0ppb", "1000ppm",
                 "Random walk, per root second"});
}

void addSeed(CLI::App& app, uint64_t& seed)
{
    const auto parse = [&seed](const std::string& text) {
        const char* const end = text.data() + text.size();
        const auto result = std::from_chars(text.data(), end, seed);
        if (result.ec != std::errc() || result.ptr != end)
            throw CLI::ValidationError("--seed", "'" + text + "' is no whole number of 64 bits");
    };
    app.add_option_function<std::string>("--seed", parse, "Same seed, same bytes of output")
        ->type_name("NUMBER")
        ->default_str(std::to_string(seed));
}

void simulate(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tOscillatorModel oscillator = options.oscillator;
    oscillator.frequencyErrorPpb = options.initialError.frequencyPpb;
    tNoise noise(options.seed);
    tSimulatedClock clock(tSimulatedSource::kStartNs +
                              static_cast<uint64_t>(options.initialError.offsetNs),
                          oscillator, options.maxFrequencyOffsetPpb, noise);
    tSimulatedSource source(clock, options.measurement, noise);
    tDiscipline(library, clock, options)
        .run(fmt::format("simulate: clock {}, seed {}; {}", options.initialError.text(),
                         options.seed, library.path),
             source);
}

} // namespace

tVerb addSimulate(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("simulate", "Discipline a simulated clock");
    const auto options = std::make_shared<tOptions>();
    addInitialErrorOptions(*verb, options->initialError, "1ms");
    addDisciplineOptions(*verb, *options);
    addMeasurementOptions(*verb, options->measurement);
    addOscillatorOptions(*verb, options->oscillator);
    addSeed(*verb, options->seed);
    return {verb, [options] { simulate(*options); }};
}
