#pragma once

#include "dravik/iServoState.h"
#include "dravik/tSpikeFilter.h"

namespace zvckmDravik {

// Holds the clock on the reference, pair by pair, through small changes of frequency.
class tServoStatePhaseLock final : public iServoState
{
public:
    tServoStatePhaseLock(iTimekeeper& timekeeper, iServoSMController& controller,
                         iServoConfig& config);

    void exit() override;
    void adjustTime(const tTimeSpan& reference, const tTimeSpan& clock) override;

private:
    double elapsedSinceLastPair(const tTimeSpan& reference);
    double controlLaw(double error, double current) const;

    tTimeSpan lastReference;       // of the previous pair in this lock
    bool hasLastReference = false; // whether it is valid
    tSpikeFilter spikeFilter;
    double lastError = 0.0; // seconds; the control input of the previous pair
};

} // namespace zvckmDravik
