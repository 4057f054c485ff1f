#include "design/designDocuments.h"

#include "design/kalmanGains.h"
#include "design/patternSearch.h"

#include <algorithm>
#include <cmath>

namespace {

// What rounding adds: timestamps to whole nanoseconds, and orders to parts per billion, from which
// the law starts again, so that their errors add up as a walk of the frequency does.
tNoiseModel withRounding(const tNoiseModel& model)
{
    tNoiseModel sum = model;
    sum.noiseNs = std::hypot(model.noiseNs, 1 / std::sqrt(6.0));
    sum.wanderPpb = std::hypot(model.wanderPpb, 1 / std::sqrt(12.0 * model.interval()));
    return sum;
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
    const double limitRate = limit * kMeanStep * model.noiseNs * 1e-9 / model.interval();
    const auto within = [](double rate) { return std::clamp(rate, 1e-9, 10.0); };
    parameters.spikeFilterEnabled = 1;
    parameters.spikeFilterHistorySize = kHistory;
    parameters.spikeFilterGrowthFactor = std::clamp(limit, 1.001, 100.0);
    parameters.spikeFilterMinThreshold = within(kFloor * limitRate);
    parameters.spikeFilterMaxThreshold = within(kCeiling * limitRate);
}

// Place is the logarithms of kp and ki, and the limit of the filter.
tServoParameters parametersAt(const std::vector<double>& place, const tNoiseModel& model)
{
    tServoParameters parameters;
    parameters.snapTimeThreshold = snapThresholdFor(model);
    tLoopGains{std::exp(place[0]), std::exp(place[1])}.putInto(parameters);
    setFilter(parameters, model, place[2]);
    return parameters;
}

// From the gains of theory to the best ones with all that theory leaves out: rounding and filter.
tServoParameters refined(const tServoLibrary& library, const tNoiseModel& model,
                         const tLoopGains& gains, const tNoiseModel& seen)
{
    std::vector<double> place = {std::log(gains.kp), std::log(gains.ki), startingLimit(model)};
    const tTrialOptions trial = trialFor(gains, model);
    const auto cost = [&](const std::vector<double>& at) {
        constexpr double kWeightOfTail = 0.3; // of normal errors the tail is 1.8 times the RMS
        const auto document = parametersAt(at, seen).documentText();
        const tTrialResult result = runTrial(library, document, model, trial);
        return result.rmsNs + kWeightOfTail * result.tailNs;
    };
    patternSearch(cost, place, {0.2, 0.4, 0.5}, 2);
    return parametersAt(place, seen);
}

// The quick loop lies, by its number of pairs, between the measurement of the frequency and the
// quiet loop: each of the two changes then leaves a transient of the same kind.
void addQuick(tDesign& design, const tNoiseModel& model)
{
    constexpr double kQuickEnough = 12;
    constexpr double kMostMeasured = 10;
    const double quietPairs = 4 / (tLoopGains::of(design.quiet).kp * model.interval());
    if (quietPairs < kQuickEnough) return;
    const double measured = std::clamp(std::round(quietPairs / 8), 1.0, kMostMeasured);
    const double pairs = std::sqrt(measured * quietPairs);
    design.quick = design.quiet;
    growingKalman(pairs, model.interval()).putInto(design.quick);
    design.measureOverNs = static_cast<int64_t>(measured) * model.intervalNs;
    design.quickNs = static_cast<int64_t>(std::ceil(2 * pairs)) * model.intervalNs;
}

} // namespace

double snapThresholdFor(const tNoiseModel& model)
{
    constexpr double kDeviations = 8;
    const double outlierNs = model.outlierRate > 0 ? 1.2 * model.outlierSizeNs : 0;
    return std::clamp((kDeviations * model.noiseNs + outlierNs) * 1e-9, 1e-8, 10.0);
}

void setSpikeFilter(tServoParameters& parameters, const tNoiseModel& model)
{
    setFilter(parameters, model, startingLimit(model));
}

tDesign designDocuments(const tServoLibrary& library, const tNoiseModel& model)
{
    const tKalmanDesign kalman = steadyKalman(withRounding(model));
    tNoiseModel seen = model; // what the filter and the threshold see of it
    seen.noiseNs = std::hypot(model.noiseNs, kalman.rmsNs);
    tDesign design;
    design.theoreticalRmsNs = kalman.rmsNs;
    design.quiet = refined(library, model, kalman.gains, seen);
    addQuick(design, model);
    return design;
}
