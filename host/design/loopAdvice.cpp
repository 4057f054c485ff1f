#include "design/loopAdvice.h"

#include "design/kalmanDesign.h"
#include "design/tLoopAnalysis.h"
#include "design/tLoopForecast.h"
#include "design/tTrial.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

std::string secondsAsText(double seconds) { return durationText(nsOf(seconds)); }

// As options take it.
std::string optionText(int64_t ns)
{
    return ns % kSecondNs == 0 ? fmt::format("{}s", ns / kSecondNs)
                               : fmt::format("{}ms", static_cast<double>(ns) / 1e6);
}

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

std::string stabilityText(const tServoParameters& parameters, const tLoopAnalysis& loop)
{
    if (loop.marginal) {
        return fmt::format("! marginal: with A = B no frequency is learnt once locked; each ppb "
                           "that the oscillator changes keeps the clock {} off\n",
                           secondsAsText(1e-9 / tLoopGains::of(parameters).kp));
    }
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

std::string bandwidthText(const tLoopAnalysis& loop)
{
    constexpr double kRounding = 1e-3;
    const bool asAsked = loop.bandwidth > 0.05 * (1 - kRounding) &&
                         loop.bandwidth < 0.1 * (1 + kRounding) &&
                         loop.peaking < 0.1 * (1 + kRounding);
    const std::string bandwidth = loop.bandwidth > 0 ? fmt::format("{:.3g} Hz", loop.bandwidth)
                                                     : "above half the rate of pairs";
    return fmt::format("  3 dB bandwidth {}, gain peaking {:.2f} dB ({} G.8273.2: 0.05 to 0.1 Hz, "
                       "at most 0.1 dB)\n",
                       bandwidth, loop.peaking, asAsked ? "meets" : "misses");
}

// Weighs the whole rate that was measured, so each lock begins with its distance from 1.
std::string frequencyLockText(const tServoParameters& parameters, const tLoopAnalysis& loop,
                              double interval)
{
    constexpr double kUsualLimit = 500e-6; // of a clock's frequency offset
    const double gain = parameters.frequencyLockGain;
    const double off = std::fabs(gain - 1);
    if (off == 0) return "";
    const double astray = off * std::max(loop.takeUp, interval);
    const std::string text = fmt::format("frequencyLockGain {:.10g} sets the frequency {} off",
                                         gain, offsetText(off * 1e9));
    if (off > kUsualLimit) {
        return fmt::format("! {}, beyond most clocks' limit of 500 ppm: never locks; better 1\n",
                           text);
    }
    if (astray < parameters.snapTimeThreshold) {
        return fmt::format("  {}: each lock begins with an error of up to {}\n", text,
                           secondsAsText(astray));
    }
    return fmt::format("! {}: the error goes to {}, beyond snapTimeThreshold, {}: {}; better 1\n",
                       text, secondsAsText(astray), secondsAsText(parameters.snapTimeThreshold),
                       off * interval < parameters.snapTimeThreshold ? "the lock never holds"
                                                                     : "never locks");
}

// Orders are rounded, and the law starts again from what was ordered: half of a step is lost.
std::string actionText(const tServoParameters& parameters)
{
    const double stepPpb = 1.0 / usualFactor(parameters.snapTimeThreshold);
    const double leastChange = 0.5e-9 * stepPpb;
    const double g = parameters.phaseLockGain;
    const double a = parameters.phaseLockCoefficientA;
    const double b = parameters.phaseLockCoefficientB;
    const double threshold = parameters.snapTimeThreshold;
    const double stays = leastChange / (g * (a - b));
    if (g * (std::fabs(a) + std::fabs(b)) * threshold < leastChange) {
        return fmt::format("! gain too small to act: no error below snapTimeThreshold, {}, makes "
                           "half of {} ppb, the least that is ordered\n",
                           secondsAsText(threshold), stepPpb);
    }
    if (stays >= threshold) {
        return fmt::format(
            "! gain too small to correct the frequency: a lasting error has to reach "
            "{} to make half of {} ppb, the least that is ordered; snapTimeThreshold "
            "is {}\n",
            secondsAsText(stays), stepPpb, secondsAsText(threshold));
    }
    return fmt::format(
        "  orders are in steps of {} ppb: without noise the error may stay within {}\n", stepPpb,
        secondsAsText(stays));
}

std::string noiseText(const tServoParameters& parameters, const tLoopAnalysis& loop,
                      const std::optional<tLoopForecast>& forecast)
{
    constexpr double kMuchMore = 1.25;
    const std::string share = fmt::format("{:.0f} % of the noise", loop.noiseGain * 100);
    if (!forecast) return fmt::format("  passes {} on to the clock\n", share);
    std::string passed = fmt::format("  passes {} on to the clock, {}\n", share,
                                     durationText(loop.noiseGain * forecast->noiseNs));
    if (forecast->roundedNs < kMuchMore * forecast->linearNs) return passed;
    return passed +
           fmt::format("! orders in steps of {} ppb, from which the law starts again, raise "
                       "its error to {} RMS; a larger gain suffers less\n",
                       1.0 / usualFactor(parameters.snapTimeThreshold),
                       durationText(forecast->roundedNs));
}

// What would hold locks that are lost.
std::string remedyText(const tServoParameters& parameters, const tLoopForecast& forecast)
{
    constexpr double kHardlyMore = 1.1;
    if (forecast.measureOverNs) {
        return fmt::format(
            "! the frequency is measured over one pair, through the noise, and {:.1f} "
            "% of starts fail: use --measure-over {}\n",
            forecast.failing * 100, optionText(*forecast.measureOverNs));
    }
    if (forecast.withoutFilter)
        return "! these locks are lost by the spike filter, which lets the error go\n";
    const double better = forecast.betterThreshold;
    if (better < kHardlyMore * parameters.snapTimeThreshold) return "";
    return fmt::format("! better a snapTimeThreshold of {}, {:.2g} in the document\n",
                       secondsAsText(better), better);
}

std::string lockText(const tServoParameters& parameters, const tLoopForecast& forecast)
{
    constexpr double kSeldom = 1e-3;     // locks lost per hour
    constexpr double kFewFailing = 0.01; // of starts
    const double threshold = parameters.snapTimeThreshold;
    const std::string text =
        fmt::format("snapTimeThreshold, {}, is {:.1f} deviations of what it is compared with",
                    secondsAsText(threshold), nsOf(threshold) / forecast.seenNs);
    if (forecast.lostPerHour < kSeldom && forecast.failing < kFewFailing)
        return fmt::format("  {}\n", text);
    if (!forecast.locks)
        return fmt::format("! {}: never locks\n", text) + remedyText(parameters, forecast);
    return fmt::format("! {}: the lock is lost about {:.3g} times an hour\n", text,
                       forecast.lostPerHour) +
           remedyText(parameters, forecast);
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
    return fmt::format("{} spike filter limits to {:.1f} mean steps of the noise, {} per pair{}\n",
                       steps < kTight ? "!" : " ", steps, secondsAsText(limit * interval),
                       steps < kTight ? ", which it cuts into: the loop is slowed" : "");
}

} // namespace

std::string loopAdvice(const tServoLibrary& library, const tServoParameters& parameters,
                       double interval, std::optional<double> noiseNs)
{
    const tLoopAnalysis loop(parameters, interval);
    const bool rounds = parameters.phaseLockCoefficientC == 1;
    std::string text = fmt::format("at one pair every {}:\n", secondsAsText(interval)) +
                       gainsText(parameters) + frequencyLockText(parameters, loop, interval) +
                       stabilityText(parameters, loop);
    if (!loop.stable) return text;
    std::optional<tLoopForecast> forecast;
    if (noiseNs) forecast = forecastLoop(library, parameters, interval, *noiseNs);
    text += dynamicsText(loop) + bandwidthText(loop) + (rounds ? actionText(parameters) : "") +
            noiseText(parameters, loop, forecast);
    if (!forecast) return text;
    return text + lockText(parameters, *forecast) + filterText(parameters, interval, *noiseNs);
}

} // namespace dravikHost
