#include "verbs/verbs.h"

#include "clocks/tSteeredClock.h"
#include "design/designDocuments.h"
#include "design/estimateNoise.h"
#include "design/tLoopAnalysis.h"
#include "servo/tServoHost.h"
#include "text/files.h"
#include "text/words.h"
#include "verbs/shared.h"
#include "watchers/tConsole.h"

#include <fmt/format.h>

#include <array>
#include <chrono>
#include <filesystem>
#include <memory>
#include <stdexcept>

namespace dravikHost {

// From the noise, given in numbers or found in a trace, to the document that suits it.

namespace {

// What is given wins over what is found.
struct tGivenNoise {
    std::optional<double> intervalNs;
    std::optional<double> noiseNs;
    std::optional<double> frequencyNoisePpb;
    std::optional<double> wanderPpb;
    std::optional<double> outlierRate;
    std::optional<double> outlierSizeNs;
};

struct tTune {
    tTraceOptions trace;
    tGivenNoise given;
    std::optional<tLoopGains> controller;
    std::string output;
    std::string quickOutput;
    std::string library;
};

void addGivenNoise(tOptionSet& options, tGivenNoise& given)
{
    options.quantity(given.intervalNs,
                     {"--interval", kDuration, "", "1ms", "24h", "Time from pair to pair"});
    options.quantity(given.noiseNs,
                     {"--noise", kDuration, "", "0ns", "1s", "White, of measurements; deviation"});
    options.quantity(given.wanderPpb, {"--wander", kFrequency, "", "0ppb", "1000ppm",
                                       "Random walk of the frequency, per root second"});
    options.quantity(given.frequencyNoisePpb,
                     {"--frequency-noise", kFrequency, "", "0ppb", "1000ppm",
                      "White; Allan deviation at 1 s; else 0.1ppb"});
    options.quantity(given.outlierRate,
                     {"--outlier-rate", kRatio, "", "0%", "100%", "Share of measurements far off"});
    options.quantity(given.outlierSizeNs,
                     {"--outlier-size", kDuration, "", "0ns", "1s", "How far they are off"});
}

tLoopGains parseController(const std::string& text)
{
    std::string_view rest = text;
    const auto kp = numberIn<double>(takeField(rest));
    const auto ki = numberIn<double>(takeField(rest));
    if (!kp || !ki || !(*kp > 0) || !(*ki > 0) || !rest.empty()) {
        throw std::invalid_argument("'" + text + "' is not KP,KI, two positive numbers");
    }
    return {*kp, *ki};
}

void requireEnough(const tTune& options)
{
    const tGivenNoise& given = options.given;
    if (options.quickOutput == "-")
        throw std::invalid_argument("--quick: several documents take files");
    if (options.controller && !options.trace.file.empty())
        throw std::invalid_argument("--from-pi: a trace has no say in it");
    if (options.controller || !options.trace.file.empty()) return;
    if (given.noiseNs && given.wanderPpb && given.intervalNs) return;
    throw std::invalid_argument(
        "A trace, or --noise, --wander and --interval, or --from-pi is required");
}

tNoiseEstimate noiseModel(const tTune& options)
{
    constexpr double kUsualFrequencyNoisePpb = 0.1;
    tNoiseEstimate model;
    model.frequencyNoisePpb = kUsualFrequencyNoisePpb;
    if (!options.trace.file.empty()) model = estimateNoise(readTrace(options.trace));
    const tGivenNoise& given = options.given;
    const auto replace = [](auto& value, const std::optional<double>& by) {
        if (by) value = static_cast<std::remove_reference_t<decltype(value)>>(*by);
    };
    replace(model.intervalNs, given.intervalNs);
    replace(model.noiseNs, given.noiseNs);
    replace(model.frequencyNoisePpb, given.frequencyNoisePpb);
    replace(model.wanderPpb, given.wanderPpb);
    replace(model.outlierRate, given.outlierRate);
    replace(model.outlierSizeNs, given.outlierSizeNs);
    model.noiseTold = model.noiseTold || given.noiseNs;
    model.frequencyNoiseTold = model.frequencyNoiseTold || given.frequencyNoisePpb;
    if (given.wanderPpb) model.leastWanderPpb = model.mostWanderPpb = *given.wanderPpb;
    return model;
}

// Four digits of a little less than a second are a second.
std::string spacingText(int64_t ns)
{
    const bool nearlySecond = ns < kSecondNs && ns >= kSecondNs / 10'000 * 9'995;
    return nearlySecond ? "1 s" : durationText(ns);
}

std::string noiseText(const tNoiseEstimate& model)
{
    const std::string outliers =
        model.outlierRate > 0 ? fmt::format(", {:.3g} % of outliers of {}", model.outlierRate * 100,
                                            durationText(model.outlierSizeNs))
                              : "";
    const std::string steps =
        model.granularityNs > 1 ? fmt::format(" in steps of {}", durationText(model.granularityNs))
                                : "";
    const std::string noise =
        model.noiseTold ? "of " + durationText(model.noiseNs)
        : model.granularityNs > 1
            ? "whose noise the steps hide, taken as " + durationText(model.noiseNs)
            : "whose noise cannot be told from the oscillator's";
    const std::string white =
        model.frequencyNoiseTold
            ? fmt::format("{:.3g} ppb of white noise at 1 s", model.frequencyNoisePpb)
            : "white noise that cannot be told from the measurements'";
    const std::string wander = model.mostWanderPpb > 0 && model.leastWanderPpb == 0
                                   ? fmt::format("at most {:.3g}", model.mostWanderPpb)
                                   : fmt::format("{:.3g}", model.wanderPpb);
    return fmt::format("measurements{} {} every {}{};\n"
                       "oscillator with {} and {} ppb of wander per root second\n",
                       steps, noise, spacingText(model.intervalNs), outliers, white, wander);
}

// A wander that the trace hardly tells, if the error depends on it.
std::string rangeText(const tNoiseEstimate& model)
{
    constexpr double kMatters = 1.5;
    const auto errorOf = [&](double wanderPpb) {
        auto other = static_cast<const tNoiseModel&>(model);
        other.wanderPpb = wanderPpb;
        return theoreticalDesign(other).rmsNs;
    };
    const double leastNs = errorOf(model.leastWanderPpb);
    const double mostNs = errorOf(model.mostWanderPpb);
    if (mostNs < kMatters * leastNs) return "";
    return fmt::format("! the trace is too short to tell the wander: {:.2g} to {:.2g} ppb per root "
                       "second are possible;\n"
                       "! by theory that leaves an error of {} to {} RMS; take a longer trace or "
                       "give --wander\n",
                       model.leastWanderPpb, model.mostWanderPpb, durationText(leastNs),
                       durationText(mostNs));
}

// Two documents side by side, as simulations through the plug-in show them.
class tComparison
{
public:
    tComparison(const tServoLibrary& library, const tNoiseModel& model,
                const tServoParameters& builtIn, const tServoParameters& tuned)
        : interval(model.interval()), columns{builtIn, tuned}
    {
        const tTrialOptions trial = trialFor(tLoopGains::of(tuned), model);
        const tStartOptions alone = {2 * trial.settlingPairs, kStarts};
        for (size_t i = 0; i < columns.size(); ++i) {
            results[i] = runTrial(library, columns[i].documentText(), model, trial);
            starts[i] = runStarts(library, columns[i].documentText(), model, alone);
        }
    }

    std::string text() const
    {
        const auto gains = [](const tServoParameters& p) { return tLoopGains::of(p); };
        const auto loop = [this](const tServoParameters& p) { return tLoopAnalysis(p, interval); };
        return fmt::format("{:<24}{:>12}{:>12}\n", "", "built-in", "this one") +
               row("error, RMS", [](const tTrialResult& r) { return durationText(r.rmsNs); }) +
               row("error, peak", [](const tTrialResult& r) { return durationText(r.peakNs); }) +
               row("locks lost per hour",
                   [](const tTrialResult& r) { return fmt::format("{:.3g}", r.lostPerHour); }) +
               fmt::format("{:<24}{:>12}{:>12}\n", "starts that fail, alone", startsText(starts[0]),
                           startsText(starts[1])) +
               rowOf("kp, 1/s", [&](auto& p) { return fmt::format("{:.4g}", gains(p).kp); }) +
               rowOf("ki, 1/s per pair",
                     [&](auto& p) { return fmt::format("{:.4g}", gains(p).ki); }) +
               rowOf("damping",
                     [&](auto& p) {
                         const auto damping = loop(p).damping;
                         return damping ? fmt::format("{:.2f}", *damping) : std::string("-");
                     }) +
               rowOf("settles within",
                     [&](auto& p) {
                         return loop(p).stable ? durationText(nsOf(loop(p).settling)) : "never";
                     }) +
               rowOf("noise that passes", [&](auto& p) {
                   return loop(p).stable ? fmt::format("{:.0f} %", loop(p).noiseGain * 100) : "-";
               });
    }

private:
    static constexpr uint64_t kStarts = 30;

    static std::string startsText(const tStartResult& result)
    {
        return fmt::format("{} of {}", result.failed, kStarts);
    }

    template <typename Text> std::string row(const char* title, Text text) const
    {
        return fmt::format("{:<24}{:>12}{:>12}\n", title, text(results[0]), text(results[1]));
    }
    template <typename Text> std::string rowOf(const char* title, Text text) const
    {
        return fmt::format("{:<24}{:>12}{:>12}\n", title, text(columns[0]), text(columns[1]));
    }

    double interval;
    std::array<tServoParameters, 2> columns;
    std::array<tTrialResult, 2> results{};
    std::array<tStartResult, 2> starts{};
};

// quick.json, quick2.json, quick3.json
std::string quickName(const std::string& file, size_t index)
{
    if (index == 0) return file;
    std::filesystem::path path = file;
    path.replace_filename(path.stem().string() + std::to_string(index + 1) +
                          path.extension().string());
    return path.string();
}

// The options with which a host acquires the lock quickly and holds it quietly.
std::string quickText(const tDesign& design, const tTune& options)
{
    if (design.quick.empty()) return "";
    const std::string quick = options.quickOutput.empty() ? "QUICK" : options.quickOutput;
    const bool unnamed = options.output.empty() || options.output == "-";
    const auto seconds = [](int64_t ns) { return static_cast<double>(ns) / 1e9; };
    std::string line = fmt::format("    --measure-over {}s --config {}",
                                   seconds(design.measureOverNs), quickName(quick, 0));
    int64_t sinceNs = 0;
    for (size_t i = 0; i < design.quick.size(); ++i) {
        sinceNs += design.quick[i].heldNs;
        const bool last = i + 1 == design.quick.size();
        line += fmt::format(" --then {}s={}", seconds(sinceNs),
                            !last     ? quickName(quick, i + 1)
                            : unnamed ? "DOCUMENT"
                                      : options.output);
    }
    return fmt::format("slow to acquire; quicker with further documents{}:\n{}\n",
                       options.quickOutput.empty() ? ", which --quick writes" : "", line);
}

void writeDocument(const std::string& file, const tServoParameters& parameters)
{
    writeText(file.empty() ? "-" : file, parameters.documentText());
}

// Without a noise the filter stays off and the threshold as it is.
tServoParameters convertedDocument(const tTune& options, const tServoParameters& builtIn)
{
    tServoParameters parameters = builtIn;
    options.controller->putInto(parameters);
    if (!options.given.noiseNs || !options.given.intervalNs) return parameters;
    const tNoiseEstimate model = noiseModel(options);
    parameters.snapTimeThreshold = snapThresholdFor(model);
    setSpikeFilter(parameters, model);
    return parameters;
}

// For the person who waits at a terminal.
class tProgressLine
{
public:
    explicit tProgressLine(tConsole& console) : console(console) {} // borrowed

    void operator()(int trials) const
    {
        using namespace std::chrono;
        const auto since = duration_cast<nanoseconds>(steady_clock::now() - started).count();
        console.progress(since,
                         [trials] { return fmt::format("designing: {} documents tried", trials); });
    }

private:
    tConsole& console;
    std::chrono::steady_clock::time_point started = std::chrono::steady_clock::now();
};

void run(const tTune& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tStillClock clock;
    tServoHost host(library, clock);
    const auto builtIn = tServoParameters::of(host.readConfig());
    if (options.controller) {
        writeDocument(options.output, convertedDocument(options, builtIn));
        return;
    }
    const tNoiseEstimate model = noiseModel(options);
    const bool toStdout = options.output.empty() || options.output == "-";
    tConsole console(toStdout);
    console.print(noiseText(model));
    const tDesign design = designDocuments(library, model, tProgressLine(console));
    const std::string comparison = tComparison(library, model, builtIn, design.quiet).text();
    console.print(
        comparison +
        fmt::format("{:<24}{:>24}\n", "theory: error, RMS", durationText(design.theoreticalRmsNs)) +
        rangeText(model) + quickText(design, options));
    writeDocument(options.output, design.quiet);
    if (options.quickOutput.empty()) return;
    for (size_t i = 0; i < design.quick.size(); ++i)
        writeDocument(quickName(options.quickOutput, i), design.quick[i].parameters);
}

} // namespace

std::function<void()> addTune(tOptionSet& options)
{
    const auto tune = std::make_shared<tTune>();
    addTraceOptions(options, tune->trace);
    addFreeRunningOption(options, tune->trace);
    addGivenNoise(options, tune->given);
    options.parsed(
        "--from-pi", "KP,KI",
        [tune](const std::string& text) { tune->controller = parseController(text); },
        "Convert a proportional-integral controller,\nwhose constants are per second and pair");
    options.text("-o,--output", "FILE", tune->output, "The document; else it goes to stdout");
    options.text("--quick", "FILE", tune->quickOutput,
                 "Also those to acquire the lock with, if any:\nFILE, then numbered ones");
    options.library(tune->library);
    options.finally([tune] { requireEnough(*tune); });
    return [tune] { run(*tune); };
}

} // namespace dravikHost
