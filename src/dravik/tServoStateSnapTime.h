#pragma once

#include "dravik/iServoState.h"

namespace zvckmDravik {

// Steps the clock onto the reference, once.
class tServoStateSnapTime final : public iServoState
{
public:
    using iServoState::iServoState;

    void adjustTime(const tTimeSpan& reference, const tTimeSpan& clock) override;
};

} // namespace zvckmDravik
