#include "verbs/verbs.h"

#include "clocks/tSteeredClock.h"
#include "design/bandwidthDesign.h"
#include "design/designDocuments.h"
#include "design/estimateNoise.h"
#include "design/tLoopAnalysis.h"
#include "servo/tServoHost.h"
#include "text/files.h"
#include "text/words.h"
#include "verbs/shared.h"
#include "watchers/tConsole.h"

#include <fmt/format.h>

#include <chrono>
#include <cmath>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <utility>
#include <vector>

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
    std::optional<double> bandwidthHz;
    std::optional<double> peakingDb;
    int hops = 1;
    std::string output;
    std::string quickOutput;
    std::string library;
};

// Returns the interval.
tOption addGivenNoise(tOptionSet& options, tGivenNoise& given)
{
    const tOption interval = options.quantity(
        given.intervalNs, {"--interval", kDuration, "", "1ms", "24h", "Time from pair to pair"});
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
    return interval;
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

// What is designed for something else than a noise.
void requireNothingElse(const tTune& options, const char* option)
{
    if (!options.trace.file.empty())
        throw std::invalid_argument(fmt::format("{}: a trace has no say in it", option));
    if (options.hops > 1)
        throw std::invalid_argument(fmt::format("{}: --hops has no say in it", option));
}

void requireEnough(const tTune& options)
{
    const tGivenNoise& given = options.given;
    if (options.quickOutput == "-")
        throw std::invalid_argument("--quick: several documents take files");
    if (options.controller) return requireNothingElse(options, "--from-pi");
    if (options.bandwidthHz) return requireNothingElse(options, "--bandwidth");
    if (!options.trace.file.empty()) return;
    if (given.noiseNs && given.wanderPpb && given.intervalNs) return;
    throw std::invalid_argument(
        "A trace, or --noise, --wander and --interval, or --from-pi, or --bandwidth, is required");
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
    model.hops = options.hops;
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
    const std::string row =
        model.hops > 1 ? fmt::format("{} clocks in a row, all like that: errors are those of the "
                                     "last one\n",
                                     model.hops)
                       : "";
    return fmt::format("measurements{} {} every {}{};\n"
                       "oscillator with {} and {} ppb of wander per root second\n{}",
                       steps, noise, spacingText(model.intervalNs), outliers, white, wander, row);
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

struct tColumn {
    const char* name;
    tServoParameters parameters;
    tTrialResult held{};
    tStartResult started{};
};

// Documents side by side, as simulations through the plug-in show them.
class tComparison
{
public:
    // As long as a loop with the gains needs.
    tComparison(const tServoLibrary& library, const tNoiseModel& model, const tLoopGains& gains,
                std::vector<tColumn> documents)
        : interval(model.interval()), columns(std::move(documents))
    {
        const tTrialOptions trial = trialFor(gains, model);
        const tStartOptions alone = {2 * trial.settlingPairs, kStarts};
        for (tColumn& column : columns) {
            const std::string document = column.parameters.documentText();
            column.held = runTrial(library, document, model, trial);
            column.started = runStarts(library, document, model, alone);
        }
    }

    std::string text() const
    {
        const auto gains = [](const tServoParameters& p) { return tLoopGains::of(p); };
        const auto loop = [this](const tServoParameters& p) { return tLoopAnalysis(p, interval); };
        return row("", [](const tColumn& c) { return c.name; }) +
               row("error, RMS", [](const tColumn& c) { return durationText(c.held.rmsNs); }) +
               row("error, peak", [](const tColumn& c) { return durationText(c.held.peakNs); }) +
               row("locks lost per hour",
                   [](const tColumn& c) { return fmt::format("{:.3g}", c.held.lostPerHour); }) +
               row("starts that fail, alone",
                   [](const tColumn& c) {
                       return fmt::format("{} of {}", c.started.failed, kStarts);
                   }) +
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

    template <typename Text> std::string row(const char* title, Text text) const
    {
        std::string line = fmt::format("{:<24}", title);
        for (const tColumn& column : columns)
            line += fmt::format("{:>12}", text(column));
        return line + "\n";
    }
    template <typename Text> std::string rowOf(const char* title, Text text) const
    {
        return row(title, [&text](const tColumn& column) { return text(column.parameters); });
    }

    double interval;
    std::vector<tColumn> columns;
};

// At the end of a row beside the document for one clock, if there can be one.
std::string comparisonText(const tServoLibrary& library, const tNoiseModel& model,
                           const tServoParameters& builtIn, const tDesign& design)
{
    std::vector<tColumn> columns = {{"built-in", builtIn}, {"this one", design.quiet}};
    std::string theory =
        fmt::format("{:<24}{:>24}", "theory: error, RMS", durationText(design.theoreticalRmsNs));
    tNoiseModel one = model;
    one.hops = 1;
    const tLoopGains gains = theoreticalDesign(one).gains;
    if (model.hops > 1 && gains.fit()) {
        columns.push_back({"for one hop", theoreticalDocument(one)});
        theory += fmt::format("{:>12}", durationText(theoreticalErrorNs(gains, model)));
    }
    return tComparison(library, model, tLoopGains::of(design.quiet), columns).text() + theory +
           "\n";
}

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

std::optional<tLoopGains> gainsAskedFor(const tTune& options)
{
    if (!options.bandwidthHz) return options.controller;
    return gainsForBandwidth(*options.bandwidthHz, *options.peakingDb,
                             secondsOf(*options.given.intervalNs));
}

// A loop of little peaking takes up a frequency slowly, and the first one is measured over two
// pairs.
void addRoomToTakeUp(tServoParameters& parameters, const tNoiseModel& model)
{
    constexpr double kDeviations = 4.5;
    const double frequency = std::sqrt(2.0) * secondsOf(model.noiseNs) / model.interval();
    const double astray = frequency * tLoopAnalysis(parameters, model.interval()).takeUp;
    double& threshold = parameters.snapTimeThreshold;
    threshold = withinBounds(zvckmservo_kSnapTimeThreshold, threshold + kDeviations * astray);
}

// Without a noise the filter stays off and the threshold as it is.
tServoParameters documentFor(const tLoopGains& gains, const tTune& options,
                             const tServoParameters& builtIn)
{
    tServoParameters parameters = builtIn;
    gains.putInto(parameters);
    if (!options.given.noiseNs || !options.given.intervalNs) return parameters;
    const tNoiseEstimate model = noiseModel(options);
    parameters.snapTimeThreshold = snapThresholdFor(model);
    if (options.bandwidthHz) addRoomToTakeUp(parameters, model);
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
    if (const auto gains = gainsAskedFor(options)) {
        writeDocument(options.output, documentFor(*gains, options, builtIn));
        return;
    }
    const tNoiseEstimate model = noiseModel(options);
    const bool toStdout = options.output.empty() || options.output == "-";
    tConsole console(toStdout);
    console.print(noiseText(model));
    const tDesign design = designDocuments(library, model, tProgressLine(console));
    console.print(comparisonText(library, model, builtIn, design) + rangeText(model) +
                  quickText(design, options));
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
    const tOption interval = addGivenNoise(options, tune->given);
    addHopsOption(options, tune->hops,
                  "So many clocks in a row, each on the one\nbefore: the last one's error counts");
    tOption bandwidth =
        options.quantity(tune->bandwidthHz, {"--bandwidth", kBandwidth, "", "0.001mHz", "500Hz",
                                             "Of the loop, where its gain is down by 3 dB"});
    tOption peaking =
        options.quantity(tune->peakingDb, {"--peaking", kGain, "", "0.001dB", "20dB",
                                           "Most of the loop's gain, beside --bandwidth"});
    bandwidth.needs(interval).needs(peaking);
    peaking.needs(bandwidth);
    options
        .parsed(
            "--from-pi", "KP,KI",
            [tune](const std::string& text) { tune->controller = parseController(text); },
            "Convert a proportional-integral controller,\nwhose constants are per second and pair")
        .excludes(bandwidth);
    options.text("-o,--output", "FILE", tune->output, "The document; else it goes to stdout");
    options.text("--quick", "FILE", tune->quickOutput,
                 "Also those to acquire the lock with, if any:\nFILE, then numbered ones");
    options.library(tune->library);
    options.finally([tune] { requireEnough(*tune); });
    return [tune] { run(*tune); };
}

} // namespace dravikHost
