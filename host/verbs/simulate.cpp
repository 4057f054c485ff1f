#include "verbs/verbs.h"

#include "loop/tSimulatedChain.h"
#include "text/files.h"
#include "verbs/shared.h"

#include <fmt/format.h>

#include <charconv>
#include <memory>
#include <stdexcept>
#include <string>

namespace dravikHost {

namespace {

struct tSimulation : tDisciplineOptions {
    tInitialError initialError;
    tOscillatorModel oscillator;
    tMeasurementModel measurement;
    std::string scenario; // file; "": none
    bool intervalGiven = false;
    uint64_t seed = 1;
};

// What a scenario says itself.
constexpr const char* kModelOptions[] = {"--initial-offset",  "--frequency-error", "--noise",
                                         "--outlier-rate",    "--outlier-size",    "--granularity",
                                         "--frequency-noise", "--frequency-wander"};

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

void checkScenario(const tOptionSet& options, tSimulation& simulation)
{
    if (simulation.scenario.empty()) return;
    for (const char* const name : kModelOptions) {
        if (!options.given(name)) continue;
        throw std::invalid_argument(
            fmt::format("{}: not with --scenario, whose file says what is simulated", name));
    }
    const tTuning& tuning = simulation.tuning;
    if (simulation.scenario == "-" && (tuning.metaDataFile == "-" || tuning.configFile == "-"))
        throw std::invalid_argument("--scenario: the standard input is taken already");
    simulation.intervalGiven = options.given("--interval");
}

// Each servo reads its documents.
void checkHops(const tSimulation& simulation)
{
    const tTuning& tuning = simulation.tuning;
    if (simulation.hops > 1 && (tuning.metaDataFile == "-" || tuning.configFile == "-"))
        throw std::invalid_argument("--hops: the standard input is enough for one servo only");
}

tScenario scenarioOf(const tSimulation& options)
{
    tScenarioStart start;
    start.keepsInterval = options.intervalGiven;
    start.phase.oscillator = options.oscillator;
    start.phase.measurement = options.measurement;
    start.phase.stepNs = options.initialError.offsetNs;
    start.phase.frequencyPpb = options.initialError.frequencyPpb;
    if (options.scenario.empty()) return {start.phase};
    return parseScenario(readText(options.scenario), options.scenario, start);
}

void run(const tSimulation& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    const tScenario scenario = scenarioOf(options);
    const tPhase& first = scenario.front();
    tSimulatedChain chain(library, scenario, options.hops, options.seed, options);
    const std::string file = options.scenario.empty() ? "" : ", scenario " + options.scenario;
    const std::string row = options.hops > 1 ? fmt::format(" at hop {}", options.hops) : "";
    runInMadeTime(library, chain.lastClock(), chain,
                  fmt::format("simulate: clock{} {}{}, seed {}; {}; {}", row,
                              tInitialError{first.stepNs, first.frequencyPpb}.text(), file,
                              options.seed, tuningText(options), library.path),
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
    options.text("--scenario", "FILE", simulation->scenario,
                 "What is simulated, and changes on the way");
    addHopsOption(options, simulation->hops,
                  "So many clocks in a row, each on the one\nbefore; the last one is shown");
    options.finally([simulation, options] {
        requireOneTuning(options, *simulation);
        checkHops(*simulation);
        checkScenario(options, *simulation);
    });
    return [simulation] { run(*simulation); };
}

} // namespace dravikHost
