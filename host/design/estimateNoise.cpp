#include "design/estimateNoise.h"

#include "design/patternSearch.h"
#include "traces/ownError.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <stdexcept>

namespace {

constexpr size_t kLeastPairs = 100;
constexpr size_t kMostPairs = 100'000; // the latest ones; more would tell little more

struct tFreeError {
    double seconds; // since the one before
    double errorNs;
};

std::vector<tFreeError> freeErrors(const tRecording& recording)
{
    const auto& pairs = recording.pairs;
    std::vector<tFreeError> errors;
    double errorNs = 0;
    for (size_t i = pairs.size() > kMostPairs ? pairs.size() - kMostPairs : 1; i < pairs.size();
         ++i) {
        errorNs += ownErrorNs(pairs[i - 1], pairs[i]);
        errors.push_back(
            {static_cast<double>(pairs[i].elapsedNs - pairs[i - 1].elapsedNs) * 1e-9, errorNs});
    }
    return errors;
}

double median(std::vector<double> values)
{
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

// A deviation that outliers do not raise, of what a straight line through two errors does not
// foresee of the third.
double unforeseenNs(const std::vector<tFreeError>& errors)
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
    tLikelihood(std::vector<tFreeError> freeErrors, double gate)
        : errors(std::move(freeErrors)), gateNs(gate)
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
            predict(errors[i].seconds, ratios);
            const double innovation = errors[i].errorNs - x;
            if (std::fabs(innovation) > gateNs && i > kSettling) {
                takeOutlier(i, innovation);
                continue;
            }
            missed = 0;
            const double s = p.xx + 1;
            if (i > kSettling) {
                sum += innovation * innovation / s;
                logs += std::log(s);
                ++count;
            }
            update(innovation, s);
        }
        variance = sum / count;
        return std::log(variance) + logs / count;
    }

    double varianceNs2() const { return variance; }
    const std::vector<double>& outliers() const { return outliersNs; }

private:
    static constexpr size_t kSettling = 10;

    void restart(size_t i)
    {
        constexpr double kUnknown = 1e12;
        x = errors[i].errorNs;
        p = {1, 0, kUnknown};
    }

    void predict(double t, const tRatios& ratios)
    {
        const tCovariance q = disturbance(ratios.frequencyNoise, ratios.wander, t);
        x += y * t;
        p = {p.xx + t * (2 * p.xy + t * p.yy) + q.xx, p.xy + t * p.yy + q.xy, p.yy + q.yy};
    }

    void update(double innovation, double s)
    {
        const double k1 = p.xx / s;
        const double k2 = p.xy / s;
        x += k1 * innovation;
        y += k2 * innovation;
        p = {p.xx - k1 * p.xx, p.xy - k1 * p.xy, p.yy - k2 * p.xy};
    }

    // Several in a row are no outliers but a step.
    void takeOutlier(size_t i, double innovation)
    {
        constexpr int kMostInARow = 3;
        outliersNs.push_back(std::fabs(innovation));
        if (++missed < kMostInARow) return;
        outliersNs.resize(outliersNs.size() - kMostInARow);
        missed = 0;
        restart(i);
    }

    std::vector<tFreeError> errors;
    double gateNs;
    double x = 0;
    double y = 0;
    tCovariance p{};
    int missed = 0;
    double variance = 0;
    std::vector<double> outliersNs;
};

// A coarse grid finds the right hill, the search its top. The wander is taken against all that is
// white, or the hill would be a ridge where the oscillator's noise is larger than the
// measurements'.
tRatios mostLikely(tLikelihood& likelihood, double interval)
{
    const auto ratios = [interval](const std::vector<double>& place) {
        const double frequencyNoise = std::exp(place[0]);
        const double wander = std::exp(place[1]) * std::hypot(1, frequencyNoise);
        return tRatios{frequencyNoise / std::sqrt(interval),
                       wander / (interval * std::sqrt(interval))};
    };
    const auto cost = [&](const std::vector<double>& place) { return likelihood(ratios(place)); };
    std::vector<double> best = {-8, -8};
    double least = cost(best);
    for (const double white : {-12, -8, -4, 0, 4}) {
        for (const double walk : {-14, -12, -10, -8, -6, -4, -2, 0, 2}) {
            const double value = cost({white, walk});
            if (!(value < least)) continue;
            least = value;
            best = {white, walk};
        }
    }
    patternSearch(cost, best, {1, 1}, 5);
    cost(best); // leaves variance and outliers of the best
    return ratios(best);
}

} // namespace

tNoiseModel estimateNoise(const tRecording& recording)
{
    constexpr double kGate = 2.5; // of what is not foreseen: six deviations of mere white noise
    constexpr double kLeastOutliers = 1e-3; // fewer are the tail of the noise
    requireCorrections(recording);
    if (recording.pairs.size() < kLeastPairs) {
        throw std::runtime_error(fmt::format("{} has {} measurements, too few to tell its noise",
                                             recording.name, recording.pairs.size()));
    }
    const std::vector<tFreeError> errors = freeErrors(recording);
    std::vector<double> intervals(errors.size());
    std::transform(errors.begin(), errors.end(), intervals.begin(),
                   [](const tFreeError& error) { return error.seconds; });
    const double interval = median(intervals);
    tLikelihood likelihood(errors, kGate * std::max(unforeseenNs(errors), 1.0));
    const tRatios ratios = mostLikely(likelihood, interval);

    tNoiseModel model;
    model.intervalNs = std::llround(interval * 1e9);
    model.noiseNs = std::sqrt(likelihood.varianceNs2());
    model.frequencyNoisePpb = ratios.frequencyNoise * model.noiseNs;
    model.wanderPpb = ratios.wander * model.noiseNs;
    const auto outliers = static_cast<double>(likelihood.outliers().size());
    const double rate = outliers / static_cast<double>(errors.size());
    if (rate < kLeastOutliers) return model;
    model.outlierRate = rate;
    model.outlierSizeNs = median(likelihood.outliers());
    return model;
}
