#include "selftune/tNoiseLevel.h"

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

constexpr double kLowestNs = 0.25;     // the first level; the last one is two milliseconds
constexpr double kClockStepNs = 1;     // clocks tell whole nanoseconds
constexpr double kVarianceOfStep = 12; // a step of 1 scatters evenly, with a variance of 1/12
constexpr double kMemory = 200;        // pairs, of the mean
constexpr int kStart = 12;             // pairs in which only the levels count
constexpr double kChange = 1e-4;       // chance that the level is another one at the next pair
constexpr double kOutlier = 1e-3;      // density of what is no noise, over that of the noise
constexpr double kFar = 4;             // between variances, which is another noise
constexpr int kSure = 4;               // pairs

} // namespace

tNoiseLevel::tNoiseLevel() : floorVariance(kClockStepNs * kClockStepNs / kVarianceOfStep)
{
    shares.fill(1.0 / kLevels);
}

void tNoiseLevel::seeChange(double changeNs)
{
    changes[changeCount++ % kChanges] = std::fabs(changeNs);
    double step = 0;
    for (const double each : changes)
        if (each > 0 && (step == 0 || each < step)) step = each;
    step = std::max(step, kClockStepNs);
    floorVariance = step * step / kVarianceOfStep;
}

double tNoiseLevel::take(double square)
{
    const double outlier = taken < kStart ? 0 : kOutlier / std::sqrt(inForce);
    constexpr double kWidth = 0.7914 * 7; // of Student's distribution, as in the bank of wanders
    const double floorNs = std::sqrt(floorVariance);
    double levelNs = kLowestNs;
    for (double& share : shares) {
        const double deviation = std::max(levelNs, floorNs);
        const double tail = 1 + square / (kWidth * deviation * deviation);
        share *= 1 / (tail * tail * tail * tail * deviation) + outlier;
        levelNs *= 2;
    }
    const double believed = believedVariance();
    const double keep = 1 - 1 / std::min<double>(++taken, kMemory);
    constexpr double kLargest = 16; // a square beyond is an outlier's, which counts as that much
    const double counted = inForce > 0 ? std::min(square, kLargest * inForce) : square;
    sum = sum * keep + counted;
    weight = weight * keep + 1;
    const bool far = believed > kFar * inForce || believed < inForce / kFar;
    elsewhere = far ? elsewhere + 1 : 0;
    if (taken > kStart && elsewhere < kSure) return set(sum / weight, false);
    return anchorAt(believed);
}

double tNoiseLevel::restartAt(double variance)
{
    shares.fill(1.0 / kLevels);
    return anchorAt(variance);
}

// At first a level that is far off was not known better; later it has changed.
double tNoiseLevel::anchorAt(double variance)
{
    constexpr double kPairsWorth = 5;
    constexpr int kKnown = 30; // pairs
    const double times = set(variance, taken > kKnown);
    elsewhere = 0;
    sum = inForce * kPairsWorth;
    weight = kPairsWorth;
    return times;
}

double tNoiseLevel::set(double variance, bool another)
{
    const double before = inForce;
    inForce = std::max(variance, floorVariance);
    return another ? std::sqrt(inForce / before) : 1;
}

// The mean on a logarithmic scale, straight between the powers of two.
double tNoiseLevel::believedVariance()
{
    double all = 0;
    for (const double share : shares)
        all += share;
    double place = 0;
    for (size_t i = 0; i < kLevels; ++i) {
        place += shares[i] / all * static_cast<double>(i);
        shares[i] = (1 - kChange) * shares[i] / all + kChange / kLevels;
    }
    const double whole = std::floor(place);
    const double levelNs = std::ldexp(kLowestNs * (1 + place - whole), static_cast<int>(whole));
    return std::max(levelNs * levelNs, floorVariance);
}

} // namespace dravikHost
