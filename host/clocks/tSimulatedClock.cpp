#include "clocks/tSimulatedClock.h"

#include <cmath>

tSimulatedClock::tSimulatedClock(uint64_t startNs, const tOscillatorModel& oscillator,
                                 int32_t maxOffsetPpb, tNoise& randomness)
    : tSteeredClock(startNs, oscillator.frequencyErrorPpb, maxOffsetPpb), model(oscillator),
      noise(randomness)
{}

// White frequency noise adds up to a phase that walks; both walks grow with the root of the time.
// Numbers are drawn at level 0 too, so that one option does not change the noise of another.
void tSimulatedClock::advance(int64_t trueNs)
{
    const double rootSeconds = std::sqrt(static_cast<double>(trueNs) * 1e-9);
    pass(trueNs, model.frequencyNoisePpb * rootSeconds * noise.normal()); // ppb * s is ns
    frequencyError += model.frequencyWanderPpb * 1e-9 * rootSeconds * noise.normal();
}
