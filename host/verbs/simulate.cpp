#include "verbs/verbs.h"

#include "loop/tDiscipline.h"
#include "sources/tSimulatedSource.h"
#include "verbs/shared.h"

#include <fmt/format.h>

#include <charconv>
#include <memory>
#include <stdexcept>

namespace dravikHost {

namespace {

struct tSimulation : tDisciplineOptions {
    tInitialError initialError;
    tOscillatorModel oscillator;
    tMeasurementModel measurement;
    uint64_t seed = 1;
};

void addMeasurementOptions(tOptionSet& options, tMeasurementModel& model)
{
    options.quantity(model.intervalNs,
                     {"--interval", kDuration, "1s", "1ns", "24h", "Time from pair to pair"});
    options.quantity(model.durationNs,
                     {"--duration", kDuration, "5min", "1ns", "438300h", "Simulated time"});
    options.quantity(model.noiseNs, {"--noise", kDuration, "20ns", "0ns", "24h",
                                     "White, of measurements; deviation"});
    options.quantity(model.outlierRate, {"--outlier-rate", kRatio, "0%", "0%", "100%",
                                         "Share of measurements far off"});
    options.quantity(model.outlierSizeNs,
                     {"--outlier-size", kDuration, "0ns", "0ns", "24h", "How far they are off"});
    options.quantity(model.granularityNs, {"--granularity", kDuration, "1ns", "1ns", "24h",
                                           "Timestamps are cut down to its multiples"});
}

void addOscillatorOptions(tOptionSet& options, tOscillatorModel& model)
{
    options.quantity(model.frequencyNoisePpb, {"--frequency-noise", kFrequency, "0.1ppb", "0ppb",
                                               "1000ppm", "White; Allan deviation at 1 s"});
    options.quantity(model.frequencyWanderPpb, {"--frequency-wander", kFrequency, "0.01ppb", "0ppb",
                                                "1000ppm", "Random walk, per root second"});
}

uint64_t parseSeed(const std::string& text)
{
    uint64_t seed = 0;
    const char* const end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, seed);
    if (result.ec != std::errc() || result.ptr != end)
        throw std::invalid_argument("'" + text + "' is not a whole number of 64 bits");
    return seed;
}

void run(const tSimulation& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tOscillatorModel oscillator = options.oscillator;
    oscillator.frequencyErrorPpb = options.initialError.frequencyPpb;
    tNoise noise(options.seed);
    tSimulatedClock clock(tSimulatedSource::kStartNs +
                              static_cast<uint64_t>(options.initialError.offsetNs),
                          oscillator, options.maxFrequencyOffsetPpb, noise);
    tSimulatedSource source(clock, options.measurement, noise);
    runInMadeTime(library, clock, source,
                  fmt::format("simulate: clock {}, seed {}; {}", options.initialError.text(),
                              options.seed, library.path),
                  options);
}

} // namespace

std::function<void()> addSimulate(tOptionSet& options)
{
    const auto simulation = std::make_shared<tSimulation>();
    addInitialErrorOptions(options, simulation->initialError, "1ms");
    addDisciplineOptions(options, *simulation);
    addMeasurementOptions(options, simulation->measurement);
    addOscillatorOptions(options, simulation->oscillator);
    options.parsed(
        "--seed", "NUMBER",
        [simulation](const std::string& text) { simulation->seed = parseSeed(text); },
        "Same seed, same bytes of output", std::to_string(simulation->seed));
    options.finally([simulation] { requireOneInput(simulation->tuning); });
    return [simulation] { run(*simulation); };
}

} // namespace dravikHost
