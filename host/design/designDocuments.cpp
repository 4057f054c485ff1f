#include "design/designDocuments.h"

#include "design/kalmanDesign.h"
#include "maths/chainGains.h"
#include "maths/patternSearch.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <stdexcept>

namespace dravikHost {

namespace {

// What rounding adds: timestamps to their steps, and orders to theirs, from which the law starts
// again, so that their errors add up as a walk of the frequency does.
tNoiseModel withRounding(const tNoiseModel& model)
{
    tNoiseModel sum = model;
    sum.noiseNs =
        std::hypot(model.noiseNs, static_cast<double>(model.granularityNs) / std::sqrt(6.0));
    const double orderedPpb = 1.0 / usualFactor(snapThresholdFor(model));
    sum.wanderPpb = std::hypot(model.wanderPpb, orderedPpb / std::sqrt(12.0 * model.interval()));
    return sum;
}

// What filter and threshold see of it on a clock with such an error.
tNoiseModel seenBy(const tNoiseModel& model, double rmsNs)
{
    tNoiseModel seen = withRounding(model);
    seen.noiseNs = std::hypot(seen.noiseNs, rmsNs);
    return seen;
}

tChainNoise chainNoiseOf(const tNoiseModel& model)
{
    return tChainNoise::of(model.noiseNs, model.frequencyNoisePpb, model.wanderPpb,
                           model.interval());
}

// The limit of the filter, in mean steps of the noise from pair to pair. If outliers are to be
// expected it pays to cut into the noise a little.
double startingLimit(const tNoiseModel& model) { return model.outlierRate > 0 ? 1.7 : 4; }

void setFilter(tServoParameters& parameters, const tNoiseModel& model, double limit)
{
    constexpr double kMeanStep = 1.128379167095513; // 2 / sqrt(pi) deviations of one measurement
    constexpr int kHistory = 4;
    constexpr double kFloor = 0.9; // of the limit, or a quiet spell would shut the filter
    constexpr double kCeiling = 6; // of the limit, so that a true step opens it
    const double limitRate = limit * kMeanStep * secondsOf(model.noiseNs) / model.interval();
    parameters.spikeFilterEnabled = 1;
    parameters.spikeFilterHistorySize = kHistory;
    parameters.spikeFilterGrowthFactor = withinBounds(zvckmservo_kSpikeFilterGrowthFactor, limit);
    parameters.spikeFilterMinThreshold =
        withinBounds(zvckmservo_kSpikeFilterMinThreshold, kFloor * limitRate);
    parameters.spikeFilterMaxThreshold =
        withinBounds(zvckmservo_kSpikeFilterMaxThreshold, kCeiling * limitRate);
}

// Place is the logarithms of kp and ki, and the limit of the filter.
tLoopGains gainsAt(const std::vector<double>& place)
{
    return {std::exp(place[0]), std::exp(place[1])};
}

tServoParameters parametersAt(const std::vector<double>& place, const tNoiseModel& model)
{
    tServoParameters parameters;
    parameters.snapTimeThreshold = snapThresholdFor(model);
    gainsAt(place).putInto(parameters);
    setFilter(parameters, model, place[2]);
    return parameters;
}

// Coarse stamps tell small errors by the share of pairs that flip, as a much larger gain would: the
// best gains may lie far below those of theory.
std::vector<double> bestOf(const std::function<double(const std::vector<double>&)>& cost,
                           const std::vector<double>& theory)
{
    std::vector<double> best = theory;
    double least = cost(best);
    for (const auto& [kp, ki] : {std::pair(-1.0, 0.0), {-1.0, -2.0}, {-2.0, -1.0}, {-2.0, -4.0}}) {
        const std::vector<double> place = {theory[0] + kp, theory[1] + ki, theory[2]};
        const double value = cost(place);
        if (!(value < least)) continue;
        least = value;
        best = place;
    }
    return best;
}

// From the gains of theory to the best ones with all that theory leaves out: rounding and filter.
tServoParameters refined(const tServoLibrary& library, const tNoiseModel& model,
                         const tLoopGains& gains, const tNoiseModel& seen,
                         const tDesignProgress& progress)
{
    int trials = 0;
    std::vector<double> place = {std::log(gains.kp), std::log(gains.ki), startingLimit(model)};
    const tTrialOptions trial = trialFor(gains, model);
    const auto cost = [&](const std::vector<double>& at) {
        constexpr double kWeightOfTail = 0.3; // of normal errors the tail is 1.8 times the RMS
        if (!gainsAt(at).fit()) return std::numeric_limits<double>::infinity();
        const auto document = parametersAt(at, seen).documentText();
        const tTrialResult result = runTrial(library, document, model, trial);
        progress(++trials);
        return result.rmsNs + kWeightOfTail * result.tailNs;
    };
    if (model.granularityNs > 1) place = bestOf(cost, place);
    patternSearch(cost, place, {0.2, 0.4, 0.5}, 2);
    return parametersAt(place, seen);
}

// How far a loop goes off while it takes up a frequency that was measured over some seconds, three
// deviations wrong; seconds. Half of that frequency over the natural one is what its peak comes to.
double takeUp(const tLoopGains& gains, const tNoiseModel& model, double measuredOver)
{
    const double frequency = 3 * std::sqrt(2.0) * secondsOf(model.noiseNs) / measuredOver;
    return frequency / 2 / std::sqrt(gains.ki / model.interval());
}

// A model far from any clock would be simulated for minutes, for a loop that nobody can use.
void requirePlausible(const tKalmanDesign& kalman, const tNoiseModel& model)
{
    constexpr double kMostPairs = 1e5;
    constexpr double kMostSeconds = 30 * 86400;
    constexpr double kMostErrorNs = 10e9; // the highest threshold
    const double pairs = 4 / (kalman.gains.kp * model.interval());
    const double seconds = pairs * model.interval();
    if (kalman.rmsNs > kMostErrorNs) {
        throw std::runtime_error(
            fmt::format("no document holds a clock with such a model: even the "
                        "best loop leaves an error of {} RMS",
                        durationText(kalman.rmsNs)));
    }
    if (!(pairs < kMostPairs) || seconds > kMostSeconds) {
        throw std::runtime_error(
            fmt::format("the noise is too large for such an oscillator and interval: the best loop "
                        "would average over {:.3g} pairs, {:.3g} days",
                        pairs, seconds / 86400));
    }
}

} // namespace

// A change to gains of a slower loop leaves it with the frequency that the quicker one had ordered
// against the noise of the last pair. So they follow one another in steps: each loop works like a
// filter that has seen three times as many pairs as the one before, from the measurement of the
// frequency to the quiet loop.
void addQuick(tDesign& design, const tNoiseModel& model)
{
    constexpr double kQuickEnough = 12;
    constexpr double kMostMeasured = 10;
    constexpr double kDayNs = 86400e9; // the longest that --measure-over takes
    constexpr double kStep = 3;
    const double quietPairs = 4 / (tLoopGains::of(design.quiet).kp * model.interval());
    if (quietPairs < kQuickEnough) return;
    const double mostMeasured =
        std::clamp(kDayNs / static_cast<double>(model.intervalNs), 1.0, kMostMeasured);
    const double measured = std::clamp(std::round(quietPairs / 8), 1.0, std::floor(mostMeasured));
    design.measureOverNs = static_cast<int64_t>(measured) * model.intervalNs;
    const double steps = std::round(std::log(quietPairs / measured) / std::log(kStep));
    for (int step = static_cast<int>(steps) - 1; step >= 1; --step) {
        const double pairs = quietPairs / std::pow(kStep, step);
        const tLoopGains gains = growingKalman(pairs, model.interval());
        if (!gains.fit()) continue; // one step less
        tQuickDocument quick;
        quick.parameters = design.quiet;
        gains.putInto(quick.parameters);
        quick.heldNs = static_cast<int64_t>(std::ceil(3 * pairs)) * model.intervalNs;
        if (design.quick.empty()) {
            const double seconds = secondsOf(design.measureOverNs);
            double& threshold = quick.parameters.snapTimeThreshold;
            threshold = withinBounds(zvckmservo_kSnapTimeThreshold,
                                     threshold + takeUp(gains, model, seconds));
        }
        design.quick.push_back(quick);
    }
}

double snapThresholdFor(const tNoiseModel& model)
{
    constexpr double kDeviations = 12; // half of them for what a change of gains leaves
    const double outlierNs = model.outlierRate > 0 ? 1.2 * model.outlierSizeNs : 0;
    return withinBounds(zvckmservo_kSnapTimeThreshold,
                        secondsOf(kDeviations * model.noiseNs + outlierNs));
}

void setSpikeFilter(tServoParameters& parameters, const tNoiseModel& model)
{
    setFilter(parameters, model, startingLimit(model));
}

tKalmanDesign theoreticalDesign(const tNoiseModel& model)
{
    if (model.hops == 1) return steadyKalman(withRounding(model));
    const tChainGains best = bestChainGains(chainNoiseOf(withRounding(model)), model.hops);
    const tLoopGains gains = {best.phase / model.interval(), best.frequency / model.interval()};
    return {gains, theoreticalErrorNs(gains, model)};
}

double theoreticalErrorNs(const tLoopGains& gains, const tNoiseModel& model)
{
    const tNoiseModel all = withRounding(model);
    const tChainGains perPair = {gains.kp * model.interval(), gains.ki * model.interval()};
    return all.noiseNs * std::sqrt(chainVariance(chainNoiseOf(all), perPair, model.hops));
}

tServoParameters theoreticalDocument(const tNoiseModel& model)
{
    const tKalmanDesign kalman = theoreticalDesign(model);
    return parametersAt(
        {std::log(kalman.gains.kp), std::log(kalman.gains.ki), startingLimit(model)},
        seenBy(model, kalman.rmsNs));
}

tDesign designDocuments(const tServoLibrary& library, const tNoiseModel& model,
                        const tDesignProgress& progress)
{
    const tKalmanDesign kalman = theoreticalDesign(model);
    requirePlausible(kalman, model);
    const tNoiseModel seen = seenBy(model, kalman.rmsNs);
    tDesign design;
    design.theoreticalRmsNs = kalman.rmsNs;
    design.quiet = refined(library, model, kalman.gains, seen, progress);
    addQuick(design, model);
    return design;
}

} // namespace dravikHost
