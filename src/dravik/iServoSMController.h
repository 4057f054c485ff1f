#pragma once

#include <cstdint>

namespace zvckmDravik {

// The numbers are not in the order of the lock-in, which is 1, 2, 3.
enum tServoStateId : uint32_t {
    kStateIdle = 0,
    kStateFrequencyLock = 1,
    kStateSnapTime = 2,
    kStatePhaseLock = 3,
};

// The states' way to change the state.
class iServoSMController
{
public:
    virtual ~iServoSMController() = default;

    // Runs the exit of the state in force, then the entry of the new one, also if they are the
    // same. It takes effect at once: the caller is no longer the state in force when it returns.
    virtual void setState(tServoStateId id) = 0;
};

} // namespace zvckmDravik
