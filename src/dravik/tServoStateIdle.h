#pragma once

#include "dravik/iServoState.h"

namespace zvckmDravik {

// In force while the servo is being constructed, so that there is always a state. It does nothing.
class tServoStateIdle final : public iServoState
{
public:
    using iServoState::iServoState;

    void adjustTime(const tTimeSpan& reference, const tTimeSpan& clock) override;
};

} // namespace zvckmDravik
