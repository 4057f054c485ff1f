#include "design/loopAdvice.h"

#include "design/designDocuments.h"
#include "design/tLoopAnalysis.h"
#include "design/tLoopGains.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <cmath>

namespace dravikHost {

namespace {

std::string secondsAsText(double seconds) { return durationText(nsOf(seconds)); }

std::string gainsText(const tServoParameters& parameters)
{
    const double c = parameters.phaseLockCoefficientC;
    const tLoopGains gains = tLoopGains::of(parameters);
    if (c == 1) {
        return fmt::format(
            "  like a PI controller with kp {:.4g} and ki {:.4g} per second and pair\n", gains.kp,
            gains.ki);
    }
    if (c > 1) return fmt::format("! C is {}, above 1: frequency runs away\n", c);
    return fmt::format("! C is {}, below 1: frequency is forgotten, so an oscillator that is 1 ppm "
                       "off keeps the clock {} off\n",
                       c, secondsAsText(1e-6 * (1 - c) / std::fabs(gains.ki)));
}

std::string stabilityText(const tLoopAnalysis& loop)
{
    if (loop.stable) {
        return loop.stableBelow > 0
                   ? fmt::format("  stable below {}\n", secondsAsText(loop.stableBelow))
                   : "  stable\n";
    }
    return loop.stableBelow > 0
               ? fmt::format("! unstable: at most {} from pair to pair, or a smaller gain\n",
                             secondsAsText(loop.stableBelow))
               : "! unstable at any interval\n";
}

std::string dynamicsText(const tLoopAnalysis& loop)
{
    constexpr double kPoorDamping = 0.4;
    const std::string settling = fmt::format("settles within {}, overshoots by {:.0f} %",
                                             secondsAsText(loop.settling), loop.overshoot * 100);
    if (!loop.damping)
        return fmt::format("! too quick: alternates from pair to pair; {}\n", settling);
    return fmt::format("{} damping {:.2f}; {}\n", *loop.damping < kPoorDamping ? "!" : " ",
                       *loop.damping, settling);
}

std::string noiseText(const tLoopAnalysis& loop, std::optional<double> noiseNs)
{
    const std::string share = fmt::format("{:.0f} % of the noise", loop.noiseGain * 100);
    if (!noiseNs) return fmt::format("  passes {} on to the clock\n", share);
    return fmt::format("  passes {} on to the clock, {}\n", share,
                       durationText(loop.noiseGain * *noiseNs));
}

// Each measurement is compared with the threshold, with its noise and that of the clock. A lost
// lock takes three pairs to come back to the next comparison.
std::string thresholdText(const tServoParameters& parameters, const tLoopAnalysis& loop,
                          double interval, double noiseNs)
{
    constexpr double kPairsToLock = 3;
    constexpr double kSeldom = 1e-3; // per hour
    const double seenNs = noiseNs * std::hypot(1, loop.noiseGain);
    const double deviations = nsOf(parameters.snapTimeThreshold) / seenNs;
    const double chance = std::erfc(deviations / std::sqrt(2.0));
    const double perHour = 3600 / interval / (kPairsToLock + 1 / chance);
    const std::string text =
        fmt::format("snapTimeThreshold, {}, is {:.1f} deviations of what it is compared with",
                    secondsAsText(parameters.snapTimeThreshold), deviations);
    if (chance == 0 || perHour < kSeldom) return fmt::format("  {}\n", text);
    tNoiseModel seen;
    seen.noiseNs = seenNs;
    return fmt::format("! {}: the lock is lost about {:.3g} times an hour; better {:.2g}\n", text,
                       perHour, snapThresholdFor(seen));
}

std::string filterText(const tServoParameters& parameters, double interval, double noiseNs)
{
    constexpr double kMeanStep = 1.128379167095513; // 2 / sqrt(pi)
    constexpr double kTight = 1.5;
    if (parameters.spikeFilterEnabled == 0) return "  spike filter off\n";
    const double meanRate = kMeanStep * secondsOf(noiseNs) / interval;
    const double growth = parameters.spikeFilterGrowthFactor;
    const double limit = std::max(std::min(growth * meanRate, parameters.spikeFilterMaxThreshold),
                                  parameters.spikeFilterMinThreshold);
    const double steps = limit / meanRate;
    return fmt::format("{} spike filter limits to {:.1f} mean steps of the noise{}\n",
                       steps < kTight ? "!" : " ", steps,
                       steps < kTight ? ", which it cuts into: the loop is slowed" : "");
}

} // namespace

std::string loopAdvice(const tServoParameters& parameters, double interval,
                       std::optional<double> noiseNs)
{
    const tLoopAnalysis loop(parameters, interval);
    std::string text = fmt::format("at one pair every {}:\n", secondsAsText(interval)) +
                       gainsText(parameters) + stabilityText(loop);
    if (!loop.stable) return text;
    text += dynamicsText(loop) + noiseText(loop, noiseNs);
    if (!noiseNs) return text;
    return text + thresholdText(parameters, loop, interval, *noiseNs) +
           filterText(parameters, interval, *noiseNs);
}

} // namespace dravikHost
