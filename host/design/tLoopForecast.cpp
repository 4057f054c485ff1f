#include "design/tLoopForecast.h"

#include "design/designDocuments.h"
#include "design/tTrial.h"

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

constexpr double kHour = 3600; // s
constexpr double kSafe = 4.5;  // deviations, of what a start leads to
constexpr double kWide = 12;   // deviations, of what a settled loop shows
const double kRootTwo = std::sqrt(2.0);

tNoiseModel usualModel(double interval, double noiseNs)
{
    constexpr double kFrequencyNoisePpb = 0.1;
    constexpr double kWanderPpb = 0.01;
    return {std::llround(nsOf(interval)), noiseNs, kFrequencyNoisePpb, kWanderPpb, 0, 0};
}

// Timestamps are in whole nanoseconds, each of the two cut down.
double linearErrorNs(const tLoopAnalysis& loop, const tNoiseModel& model)
{
    const double rootInterval = std::sqrt(model.interval());
    return std::hypot(loop.noiseGain * std::hypot(model.noiseNs, 1 / std::sqrt(6.0)),
                      loop.phaseWalkGain * model.frequencyNoisePpb * rootInterval,
                      loop.frequencyWalkGain * model.wanderPpb * rootInterval);
}

// Per pair, of a settled loop: each measurement is compared with the threshold, with its noise and
// that of the clock. A lost lock takes three pairs to come back to the next comparison.
double lostWhileSettled(double threshold, double seenNs)
{
    constexpr double kPairsToLock = 3;
    const double chance = std::erfc(nsOf(threshold) / seenNs / kRootTwo);
    return chance > 0 ? 1 / (kPairsToLock + 1 / chance) : 0;
}

// So many starts, each long enough to settle and to show as much again.
tStartOptions startsFor(const tLoopAnalysis& loop, double interval, int64_t measureOverNs)
{
    constexpr double kAllPairs = 500'000; // a quarter of a second of work
    const double before = static_cast<double>(measureOverNs) / nsOf(interval);
    const double pairs = std::clamp(20 * (loop.settling / interval + before), 200.0, 100'000.0);
    return {static_cast<int64_t>(pairs),
            static_cast<uint64_t>(std::clamp(kAllPairs / pairs, 8.0, 400.0)), measureOverNs};
}

// Losses while settled are counted if there are enough, else theory knows better.
double lostPerHour(const tStartResult& found, const tStartOptions& starts, double interval,
                   double settledPerPair)
{
    constexpr double kEnough = 10;
    const auto early = static_cast<double>(found.lostEarly);
    const auto late = static_cast<double>(found.lostLate);
    const auto count = static_cast<double>(starts.starts);
    const double half = static_cast<double>(starts.pairs) / 2;
    const double again = 1 + early / count; // a lock lost is followed by a start
    const double perPair = late >= kEnough
                               ? late / count / half
                               : std::min(settledPerPair * again, kEnough / count / half);
    const double atStart = std::max(early / count - perPair * half, 0.0);
    return perPair * kHour / interval + atStart / std::max(half * interval / kHour, 1.0);
}

// The orders' rounding by itself: nothing else that is not linear comes into it.
double roundedErrorNs(const tServoLibrary& library, tServoParameters parameters,
                      const tLoopAnalysis& loop, const tNoiseModel& model)
{
    parameters.spikeFilterEnabled = 0;
    const double highest = zvckmservo_parameters[zvckmservo_kSnapTimeThreshold].highest;
    parameters.snapTimeThreshold = highest / usualFactor(parameters.snapTimeThreshold);
    tStartOptions starts = startsFor(loop, model.interval(), 0);
    starts.starts = std::max<uint64_t>(starts.starts / 4, 8);
    return runTrial(library, parameters.documentText(), model,
                    {starts.pairs / 2, starts.pairs / 2, starts.starts})
        .rmsNs;
}

// The frequency, as two measurements tell it, is wrong by their noise over the time between. About
// the least time after which that does not lead as far as the threshold.
std::optional<int64_t> timeToMeasure(const tServoParameters& parameters, const tLoopAnalysis& loop,
                                     const tNoiseModel& model, double seenNs)
{
    constexpr double kDayNs = 86400e9; // the longest that --measure-over takes
    constexpr double kLeastShare = 0.3;
    const double roomNs = nsOf(parameters.snapTimeThreshold) / kSafe;
    const double leftNs = std::sqrt(std::max(roomNs * roomNs - seenNs * seenNs, 0.0));
    const double seconds =
        kRootTwo * model.noiseNs * loop.takeUp / std::max(leftNs, kLeastShare * roomNs);
    const double pairs = std::max(std::ceil(seconds / model.interval()), 2.0);
    if (pairs * nsOf(model.interval()) > kDayNs) return std::nullopt;
    return static_cast<int64_t>(pairs) * model.intervalNs;
}

// From ns to seconds, to two digits.
double roundedUp(double ns)
{
    const double value = secondsOf(ns);
    const double unit = std::pow(10, std::floor(std::log10(value)) - 1);
    return std::ceil(value / unit) * unit;
}

// The starts of one document, and variants of it.
class tStarter
{
public:
    tStarter(const tServoLibrary& library, const tServoParameters& parameters,
             const tLoopAnalysis& loop, const tNoiseModel& model, double seenNs)
        : library(library), parameters(parameters), loop(loop), model(model),
          settledPerPair(lostWhileSettled(parameters.snapTimeThreshold, seenNs))
    {}

    void foretell(tLoopForecast& forecast) const
    {
        const tStartOptions starts = startsFor(loop, model.interval(), 0);
        const auto found = runStarts(library, parameters.documentText(), model, starts);
        forecast.locks = found.neverLocked < static_cast<int64_t>(starts.starts);
        forecast.failing = static_cast<double>(found.failed) / static_cast<double>(starts.starts);
        forecast.lostPerHour = lostPerHour(found, starts, model.interval(), settledPerPair);
    }

    double lostIfMeasuredOver(int64_t ns) const { return lost(parameters, ns); }

    double lostWithoutFilter() const
    {
        tServoParameters other = parameters;
        other.spikeFilterEnabled = 0;
        return lost(other, 0);
    }

private:
    double lost(const tServoParameters& other, int64_t measureOverNs) const
    {
        const tStartOptions starts = startsFor(loop, model.interval(), measureOverNs);
        const auto found = runStarts(library, other.documentText(), model, starts);
        return lostPerHour(found, starts, model.interval(), settledPerPair);
    }

    const tServoLibrary& library;
    const tServoParameters& parameters;
    const tLoopAnalysis& loop;
    const tNoiseModel& model;
    double settledPerPair;
};

} // namespace

tLoopForecast forecastLoop(const tServoLibrary& library, const tServoParameters& parameters,
                           double interval, double noiseNs)
{
    constexpr double kFewer = 0.1; // of the locks lost, if advice is to be worth it
    const tLoopAnalysis loop(parameters, interval);
    const tNoiseModel model = usualModel(interval, noiseNs);
    tLoopForecast forecast{};
    forecast.noiseNs = noiseNs;
    forecast.seenNs = std::hypot(noiseNs, noiseNs * loop.noiseGain);
    forecast.linearNs = linearErrorNs(loop, model);
    forecast.roundedNs = roundedErrorNs(library, parameters, loop, model);
    const double astrayNs = kRootTwo * noiseNs * loop.takeUp / interval;
    forecast.betterThreshold =
        roundedUp(std::max(kWide * forecast.seenNs, kSafe * std::hypot(forecast.seenNs, astrayNs)));

    const tStarter starter(library, parameters, loop, model, forecast.seenNs);
    starter.foretell(forecast);
    const double fewNow = kFewer * forecast.lostPerHour;
    const auto measured = timeToMeasure(parameters, loop, model, forecast.seenNs);
    if (forecast.failing == 0) return forecast;
    if (measured && starter.lostIfMeasuredOver(*measured) < fewNow) {
        forecast.measureOverNs = measured;
    } else if (parameters.spikeFilterEnabled != 0) {
        forecast.withoutFilter = starter.lostWithoutFilter() < fewNow;
    }
    return forecast;
}

} // namespace dravikHost
