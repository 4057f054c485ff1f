#include "design/estimateNoise.h"

#include "maths/median.h"
#include "maths/patternSearch.h"
#include "maths/tKalmanFilter.h"
#include "traces/tRecording.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <numeric>
#include <stdexcept>

namespace dravikHost {

namespace {

constexpr size_t kLeastPairs = 100;
constexpr size_t kMostPairs = 100'000; // the latest ones; more would tell little more

struct tFreeRunningError {
    double seconds; // since the one before
    double errorNs;
};

std::vector<tFreeRunningError> freeRunningErrors(const tRecording& recording)
{
    const auto& pairs = recording.pairs;
    std::vector<tFreeRunningError> errors;
    double errorNs = 0;
    for (size_t i = pairs.size() > kMostPairs ? pairs.size() - kMostPairs : 1; i < pairs.size();
         ++i) {
        errorNs += ownErrorNs(pairs[i - 1], pairs[i]);
        errors.push_back({secondsOf(pairs[i].elapsedNs - pairs[i - 1].elapsedNs), errorNs});
    }
    return errors;
}

// A deviation that outliers do not raise, of what a straight line through two errors does not
// foresee of the third.
double unforeseenNs(const std::vector<tFreeRunningError>& errors)
{
    constexpr double kDeviationOfMedian = 1.4826;
    std::vector<double> misses;
    for (size_t i = 2; i < errors.size(); ++i) {
        const double slope =
            (errors[i - 1].errorNs - errors[i - 2].errorNs) / errors[i - 1].seconds;
        const double line = errors[i - 1].errorNs + slope * errors[i].seconds;
        misses.push_back(std::fabs(errors[i].errorNs - line));
    }
    return kDeviationOfMedian * median(misses);
}

// All variances as multiples of the measurements' own, which follows from the innovations.
struct tRatios {
    double frequencyNoise; // per ns of noise
    double wander;         // per ns of noise
};

class tLikelihood
{
public:
    tLikelihood(std::vector<tFreeRunningError> errors, double gateNs)
        : errors(std::move(errors)), gateNs(gateNs)
    {}

    // The negative logarithm for each measurement, twice, less what does not depend on the ratios.
    double operator()(const tRatios& ratios)
    {
        restart(0);
        outliersNs.clear();
        double sum = 0;
        double logs = 0;
        double count = 0;
        for (size_t i = 1; i < errors.size(); ++i) {
            const double t = errors[i].seconds;
            filter.predict(t, disturbance(ratios.frequencyNoise, ratios.wander, t));
            const double innovation = errors[i].errorNs - filter.phase;
            const bool settled = i > restartedAt + kSettling;
            if (std::fabs(innovation) > gateNs && settled) {
                takeOutlier(i, innovation);
                continue;
            }
            missed = 0;
            const double s = filter.covariance.xx + 1;
            if (settled) {
                sum += innovation * innovation / s;
                logs += std::log(s);
                ++count;
            }
            filter.update(innovation, 1);
        }
        variance = sum / count;
        counted = count;
        return std::log(variance) + logs / count;
    }

    double varianceNs2() const { return variance; }
    double measurements() const { return counted; }
    const std::vector<double>& outliers() const { return outliersNs; }

private:
    static constexpr size_t kSettling = 10;

    void restart(size_t i)
    {
        constexpr double kUnknown = 1e12;
        filter.phase = errors[i].errorNs;
        filter.covariance = {1, 0, kUnknown};
        restartedAt = i;
    }

    // Several in a row are no outliers but a step.
    void takeOutlier(size_t i, double innovation)
    {
        constexpr int kMostInARow = 3;
        outliersNs.push_back(std::fabs(innovation));
        if (++missed < kMostInARow) return;
        outliersNs.resize(outliersNs.size() - kMostInARow);
        restart(i);
    }

    std::vector<tFreeRunningError> errors;
    double gateNs;
    tKalmanFilter filter;   // in multiples of the measurements' variance
    size_t restartedAt = 0; // its frequency is not known for some pairs then
    int missed = 0;
    double variance = 0;
    double counted = 0;
    std::vector<double> outliersNs;
};

// The ratios by the logarithms of the white noise and the wander. The wander is taken against all
// that is white, or the hill would be a ridge where the oscillator's noise is larger than the
// measurements'.
class tHill
{
public:
    tHill(tLikelihood& likelihood, double interval) : likelihood(likelihood), interval(interval) {}

    tRatios ratios(const std::vector<double>& place) const
    {
        const double frequencyNoise = std::exp(place[0]);
        const double wander = std::exp(place[1]) * std::hypot(1, frequencyNoise);
        return {frequencyNoise / std::sqrt(interval), wander / (interval * std::sqrt(interval))};
    }

    double cost(const std::vector<double>& place) const { return likelihood(ratios(place)); }

    // A coarse grid finds the right hill, the search its top.
    std::vector<double> top() const
    {
        std::vector<double> best;
        double least = std::numeric_limits<double>::infinity();
        for (int white = kLeastWhite; white <= kMostWhite; white += 4) {
            for (int walk = kLeastWalk; walk < kMostWalk; walk += 2) {
                const std::vector<double> place(
                    {static_cast<double>(white), static_cast<double>(walk)});
                const double value = cost(place);
                if (!(value < least)) continue;
                least = value;
                best = place;
            }
        }
        patternSearch([this](const auto& place) { return cost(place); }, best, {1, 1}, 5);
        return best;
    }

    // The wander where the likelihood has fallen as far as one time in twenty allows, towards more
    // or less of it; 0 if it never does.
    double wanderAtFoot(const std::vector<double>& top, double direction) const
    {
        constexpr double kStep = 0.1;
        const double most = cost(top) + kFall / likelihood.measurements();
        std::vector<double> place = top;
        place[1] = std::max<double>(place[1], kLeastWalk);
        double step = kStep;
        while (true) {
            place[1] += direction * step;
            if (place[1] < kLeastWalk) return 0;
            const auto along = [&](const std::vector<double>& white) {
                return cost({white[0], place[1]});
            };
            std::vector<double> white = {place[0]};
            const double least = patternSearch(along, white, {1}, 2);
            place[0] = white[0];
            if (!(least < most) || place[1] > kMostWalk) break;
            step *= 1 + kStep;
        }
        cost(place);
        return ratios(place).wander * std::sqrt(likelihood.varianceNs2());
    }

    // Whether all of it may as well be the oscillator's.
    bool needsNoise(const std::vector<double>& top) const
    {
        constexpr double kAllWhite = 10;
        const double most = cost(top) + kFall / likelihood.measurements();
        std::vector<double> walk = {top[1]};
        const auto along = [this](const std::vector<double>& at) {
            return cost({kAllWhite, at[0]});
        };
        return !(patternSearch(along, walk, {2}, 4) < most);
    }

private:
    // Of twice the logarithm, one time in twenty: chi-squared with one degree of freedom.
    static constexpr double kFall = 3.84;

    // Logarithms of ratios; what lies beyond them shows no more in any trace.
    static constexpr int kLeastWhite = -12;
    static constexpr int kMostWhite = 4;
    static constexpr int kLeastWalk = -14;
    static constexpr int kMostWalk = 4;

    tLikelihood& likelihood;
    double interval;
};

double secondsBetween(const std::vector<tFreeRunningError>& errors, double median)
{
    double sum = 0;
    double count = 0;
    for (const tFreeRunningError& error : errors) {
        if (std::fabs(error.seconds - median) > median / 2) continue; // a gap
        sum += error.seconds;
        ++count;
    }
    return sum / count;
}

// What all errors are multiples of.
int64_t stepOf(const tRecording& recording)
{
    constexpr double kExact = 1e-3; // ns
    int64_t step = 0;
    for (const tRecordedPair& pair : recording.pairs) {
        const double whole = std::round(pair.errorNs);
        if (std::fabs(pair.errorNs - whole) > kExact) return 1;
        step = std::gcd(step, std::llabs(static_cast<int64_t>(whole)));
        if (step == 1) return 1;
    }
    return std::max<int64_t>(step, 1);
}

// In steps as large as the noise, errors show little else than the steps: two stamps of an edge
// each flip between two values. Noise that can still not be told is taken as small.
void takeStepsOut(tNoiseEstimate& estimate)
{
    constexpr double kOfSteps = 0.65;
    constexpr double kTaken = 0.05;
    const auto step = static_cast<double>(estimate.granularityNs);
    if (estimate.granularityNs == 1) return;
    estimate.noiseTold = estimate.noiseTold && estimate.noiseNs > kOfSteps * step;
    estimate.noiseNs = estimate.noiseTold
                           ? std::sqrt(estimate.noiseNs * estimate.noiseNs - step * step / 6)
                           : kTaken * step;
}

} // namespace

tNoiseEstimate estimateNoise(const tRecording& recording)
{
    constexpr double kGate = 2.5;  // of what is not foreseen: six deviations of mere white noise
    constexpr double kLost = 0.02; // of the other noise
    constexpr double kLeastOutliers = 1e-3; // fewer are the tail of the noise
    requireCorrections(recording);
    if (recording.pairs.size() < kLeastPairs) {
        throw std::runtime_error(fmt::format("{} has {} measurements, too few to tell its noise",
                                             recording.name, recording.pairs.size()));
    }
    const std::vector<tFreeRunningError> errors = freeRunningErrors(recording);
    std::vector<double> intervals(errors.size());
    std::transform(errors.begin(), errors.end(), intervals.begin(),
                   [](const tFreeRunningError& error) { return error.seconds; });
    const double interval = median(intervals);
    const int64_t stepNs = stepOf(recording);
    tLikelihood likelihood(errors,
                           kGate * std::max(unforeseenNs(errors), static_cast<double>(stepNs)));
    const tHill hill(likelihood, interval);
    const std::vector<double> top = hill.top();
    const tRatios ratios = hill.ratios(top);

    const double mostWander = hill.wanderAtFoot(top, +1);
    const double leastWander = hill.wanderAtFoot(top, -1);
    const bool noisy = hill.needsNoise(top);
    tNoiseEstimate model;
    hill.cost(top); // leaves variance and outliers of the best
    model.intervalNs = std::llround(nsOf(secondsBetween(errors, interval)));
    model.noiseNs = std::sqrt(likelihood.varianceNs2());
    model.frequencyNoisePpb = ratios.frequencyNoise * model.noiseNs;
    model.wanderPpb = ratios.wander * model.noiseNs;
    model.mostWanderPpb = std::max(mostWander, model.wanderPpb);
    model.leastWanderPpb = std::min(leastWander, model.wanderPpb);
    const double whiteNs = model.frequencyNoisePpb * std::sqrt(interval);
    model.noiseTold = noisy && model.noiseNs > kLost * std::max(whiteNs, 1.0);
    model.frequencyNoiseTold = whiteNs > kLost * model.noiseNs;
    model.granularityNs = stepNs;
    takeStepsOut(model);
    const auto outliers = static_cast<double>(likelihood.outliers().size());
    const double rate = outliers / static_cast<double>(errors.size());
    if (rate < kLeastOutliers) return model;
    model.outlierRate = rate;
    model.outlierSizeNs = median(likelihood.outliers());
    return model;
}

} // namespace dravikHost
