#include "dravik/tServoStatePhaseLock.h"

#include "dravik/clamp.h"

#include <cmath>

// Phase lock is a difference equation in the frequency offset u and the control input e, which is
// minus the filtered phase error (the clock ahead makes e negative and slows the clock):
//
//     u(n) = C * u(n-1) + g * (A * e(n) - B * e(n-1))
//
// u(n-1) is not remembered: it is what the clock says its offset is, so whatever rounding or limit
// the host applied is part of the loop. The law knows no interval: e is in seconds, and g weighs it
// once for each pair.

namespace zvckmDravik {

tServoStatePhaseLock::tServoStatePhaseLock(iTimekeeper& timekeeper, iServoSMController& controller,
                                           iServoConfig& config)
    : iServoState(timekeeper, controller, config), spikeFilter(config)
{}

void tServoStatePhaseLock::exit()
{
    hasLastReference = false;
    spikeFilter.reset();
    lastError = 0.0;
}

void tServoStatePhaseLock::adjustTime(const tTimeSpan& reference, const tTimeSpan& clock)
{
    const double phaseError = (clock - reference).toSeconds();
    if (config.getSnapTimeThreshold() <= std::fabs(phaseError)) {
        // Back to frequency lock. This pair is spent: the next one opens a new measurement.
        controller.setState(kStateFrequencyLock);
        return;
    }

    const double elapsed = elapsedSinceLastPair(reference);
    const double error = -spikeFilter.filter(phaseError, elapsed);
    const double current = timekeeper.getFrequency();
    const double offset = clampMaximumFirst(
        controlLaw(error, current), config.getMaxFrequencyOffset(), config.getMinFrequencyOffset());
    timekeeper.setFrequency(offset + 1.0);
    lastError = error; // only now: a pair that the clock refused is not part of the law's past
}

// Seconds on the reference; 0.0 for the first pair in a lock.
double tServoStatePhaseLock::elapsedSinceLastPair(const tTimeSpan& reference)
{
    const double elapsed = hasLastReference ? (reference - lastReference).toSeconds() : 0.0;
    lastReference = reference;
    hasLastReference = true;
    return elapsed;
}

double tServoStatePhaseLock::controlLaw(double error, double current) const
{
    const double gain = config.getPhaseLockGain();
    const double a = config.getPhaseLockCoefficientA();
    const double b = config.getPhaseLockCoefficientB();
    const double c = config.getPhaseLockCoefficientC();
    const double previous = (gain * b) * lastError;
    const double change = (gain * a) * error - previous;
    return change + (current - 1.0) * c;
}

} // namespace zvckmDravik
