#include "selftune/tWanderBank.h"

#include <cmath>

namespace dravikHost {

namespace {

constexpr double kLowestRatio = 3e-5; // each next one is twice as large, up to 16
constexpr double kChange = 5e-4;      // chance that the ratio is another one at the next pair

// How likely a measurement is that is off by so much, squared, in variances foreseen: Student's
// distribution of seven degrees of freedom, which an outlier does not persuade, so narrow that a
// normal one of the right variance is the likeliest.
double likelihood(double square, double variance)
{
    constexpr double kWidth = 0.7914 * 7;
    const double tail = 1 + square / kWidth;
    return 1 / (tail * tail * tail * tail * std::sqrt(variance));
}

} // namespace

tWanderBank::tWanderBank() { shares.fill(1.0 / kModels); }

void tWanderBank::begin(const tKalmanFilter& start, double seconds)
{
    passedSeconds = 0;
    filters.fill(start);
    double ratio = kLowestRatio;
    for (double& each : wander) {
        each = ratio / (seconds * std::sqrt(seconds));
        ratio *= 2;
    }
}

void tWanderBank::predict(double seconds)
{
    const bool asBefore = seconds == passedSeconds;
    passedSeconds = seconds;
    for (size_t i = 0; i < kModels; ++i) {
        if (!asBefore) added[i] = disturbance(0, wander[i], seconds);
        filters[i].predict(seconds, added[i]);
    }
}

void tWanderBank::take(double phaseNs, double noiseVariance)
{
    for (size_t i = 0; i < kModels; ++i) {
        const double innovation = phaseNs - filters[i].phase;
        const double variance = filters[i].covariance.xx + 1;
        shares[i] *= likelihood(innovation * innovation / (variance * noiseVariance), variance);
        filters[i].update(innovation, 1);
    }
    normalise();
    for (double& share : shares)
        share = (1 - kChange) * share + kChange / kModels;
}

void tWanderBank::move(double phaseNs, double frequencyPpb, const tCovariance& doubt)
{
    for (tKalmanFilter& filter : filters)
        filter.move(phaseNs, frequencyPpb, doubt);
}

// In whole octaves, as the models are. What comes in at the edge was never looked at.
void tWanderBank::noiseGrew(double times)
{
    constexpr double kNever = 1e-6;
    constexpr double kHalfOctave = 1.41421356;
    const auto shift = [this](size_t from, size_t to) {
        for (size_t i = 0; i + 1 < kModels; ++i) {
            const size_t at = from < to ? kModels - 1 - i : i;
            shares[at] = shares[at + from - to];
        }
        shares[from < to ? 0 : kModels - 1] = kNever;
    };
    double left = times;
    while (left > kHalfOctave) {
        shift(1, 0);
        left /= 2;
    }
    while (left < 1 / kHalfOctave) {
        shift(0, 1);
        left *= 2;
    }
    normalise();
}

// The mean on a logarithmic scale, straight between the powers of two.
double tWanderBank::ratio() const
{
    double place = 0;
    for (size_t i = 0; i < kModels; ++i)
        place += shares[i] * static_cast<double>(i);
    const double whole = std::floor(place);
    return std::ldexp(kLowestRatio * (1 + place - whole), static_cast<int>(whole));
}

void tWanderBank::normalise()
{
    double sum = 0;
    for (const double share : shares)
        sum += share;
    for (double& share : shares)
        share /= sum;
}

} // namespace dravikHost
