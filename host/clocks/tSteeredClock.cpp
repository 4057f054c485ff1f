#include "clocks/tSteeredClock.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <cmath>
#include <stdexcept>

namespace dravikHost {

tSteeredClock::tSteeredClock(uint64_t startNs, double frequencyErrorPpb, int32_t maxOffsetPpb)
    : frequencyError(frequencyErrorPpb * 1e-9), wholeNs(startNs), limitPpb(maxOffsetPpb)
{}

void tSteeredClock::step(int64_t deltaNs) { wholeNs += static_cast<uint64_t>(deltaNs); }

void tSteeredClock::setOffsetPpb(double offsetPpb)
{
    if (offsetPpb < minOffsetPpb() || offsetPpb > maxOffsetPpb()) {
        throw std::out_of_range(
            fmt::format("an offset of {} ppb is beyond the clock's {} ppb", offsetPpb, limitPpb));
    }
    orderedPpb = offsetPpb;
}

double tSteeredClock::aheadOfNs(uint64_t trueNs) const
{
    return static_cast<double>(static_cast<int64_t>(wholeNs - trueNs)) + fractionNs;
}

void tSteeredClock::pass(int64_t trueNs, double phaseNoiseNs)
{
    // (1 + y)(1 + u) - 1, without the 1 that would cost the small terms their last digits.
    const double ordered = orderedPpb * 1e-9;
    const double excess = frequencyError + ordered + frequencyError * ordered;
    fractionNs += static_cast<double>(trueNs) * excess + phaseNoiseNs;
    const double carryNs = std::floor(fractionNs);
    fractionNs -= carryNs;
    wholeNs += static_cast<uint64_t>(trueNs) + static_cast<uint64_t>(static_cast<int64_t>(carryNs));
}

tSimulatedClock::tSimulatedClock(uint64_t startNs, const tOscillatorModel& model,
                                 int32_t maxOffsetPpb, tNoise& noise, uint64_t seed)
    : tSteeredClock(startNs, model.frequencyErrorPpb, maxOffsetPpb), model(model), noise(noise),
      drift(seed)
{}

// White frequency noise adds up to a phase that walks; both walks grow with the root of the time.
// Numbers are drawn at level 0 too, so that one option does not change the noise of another. Drift
// is so small that what the ordered offset makes of it is left out.
void tSimulatedClock::advance(int64_t trueNs)
{
    const double rootSeconds = std::sqrt(secondsOf(trueNs));
    const double driftedNs = drift.nextPpb(model.drift, trueNs) * secondsOf(trueNs); // ppb * s
    pass(trueNs, model.frequencyNoisePpb * rootSeconds * noise.normal() + driftedNs);
    frequencyError += model.frequencyWanderPpb * 1e-9 * rootSeconds * noise.normal();
}

} // namespace dravikHost
