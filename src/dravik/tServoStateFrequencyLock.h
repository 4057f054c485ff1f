#pragma once

#include "dravik/iServoState.h"

namespace zvckmDravik {

// Measures the clock's rate against the reference over two pairs and corrects it in one stroke.
class tServoStateFrequencyLock final : public iServoState
{
public:
    using iServoState::iServoState;

    void exit() override;
    void adjustTime(const tTimeSpan& reference, const tTimeSpan& clock) override;

private:
    double newRatio(const tTimeSpan& reference, const tTimeSpan& clock);

    tTimeSpan firstReference;
    tTimeSpan firstClock;
    bool hasFirstPair = false; // whether the two above are valid
};

} // namespace zvckmDravik
