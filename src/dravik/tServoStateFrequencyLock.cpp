#include "dravik/tServoStateFrequencyLock.h"

#include "dravik/clamp.h"

// Frequency lock keeps the first pair and compares the second one with it:
//
//     rate = elapsed on the reference / elapsed on the clock
//     new ratio = present ratio * (rate * gain)
//
// The gain weighs the whole rate, not its distance from 1, so it is for fine work around 1. Within
// the host's limits the new ratio is set and snap time follows; else the clock gets the limit, and
// the measurement starts over from there.

namespace zvckmDravik {

void tServoStateFrequencyLock::exit() { hasFirstPair = false; }

void tServoStateFrequencyLock::adjustTime(const tTimeSpan& reference, const tTimeSpan& clock)
{
    if (!hasFirstPair) {
        firstReference = reference;
        firstClock = clock;
        hasFirstPair = true;
        return;
    }

    const double ratio = newRatio(reference, clock);
    const double offset = ratio - 1.0;
    // Both comparisons are false for a value that is not a number.
    if (offset <= config.getMaxFrequencyOffset() && offset >= config.getMinFrequencyOffset()) {
        // Should the clock fail here, the first pair stays and the next one measures from it.
        timekeeper.setFrequency(ratio);
        controller.setState(kStateSnapTime);
    } else {
        const double clamped = clampMaximumFirst(offset, config.getMaxFrequencyOffset(),
                                                 config.getMinFrequencyOffset());
        hasFirstPair = false;
        timekeeper.setFrequency(clamped + 1.0);
    }
}

// Divides by zero on purpose: no elapsed time on the clock makes an infinity or not a number, and
// both miss the limits.
__attribute__((no_sanitize("float-divide-by-zero"))) double
tServoStateFrequencyLock::newRatio(const tTimeSpan& reference, const tTimeSpan& clock)
{
    const double referenceElapsed = (reference - firstReference).toSeconds();
    const double clockElapsed = (clock - firstClock).toSeconds();
    const double rate = referenceElapsed / clockElapsed;
    const double current = timekeeper.getFrequency();
    return current * (rate * config.getFrequencyLockGain());
}

} // namespace zvckmDravik
