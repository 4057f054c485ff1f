#include "dravik/tServoStateSnapTime.h"

// Snap time moves the clock onto the reference once, in whole nanoseconds, and hands over to phase
// lock. An error below the threshold is left to the control law. If the step fails, the next pair
// tries again with its own difference.

namespace zvckmDravik {

void tServoStateSnapTime::adjustTime(const tTimeSpan& reference, const tTimeSpan& clock)
{
    const tTimeSpan delta = reference - clock;
    // Integers, on the threshold cut to nanoseconds: not the comparison that phase lock makes.
    if (tTimeSpan(delta.getMagnitude()) >= tTimeSpan(config.getSnapTimeThreshold())) {
        timekeeper.stepTime(delta);
    }
    controller.setState(kStatePhaseLock);
}

} // namespace zvckmDravik
