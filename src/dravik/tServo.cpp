#include "dravik/tServo.h"

#include "dravik/saturate.h"
#include "zverr/tStatusGuard.h"
#include "zvplat/tFixedStatusGuard.h"

// The lock, the state in force, and the host's clock in ratios and time spans. All operations on
// the clock follow one pattern: the lock, a fresh status, one call of the host, and the end of the
// status's scope, which raises a failure and so leaves through the lock's own scope.

namespace zvckmDravik {

namespace {

constexpr double kPerPpb = 1e-9; // fraction of nominal rate; multiplied with, never divided by 1e9

// Rounds to the nearest integer, halves away from zero.
int32_t roundToInt32(double value)
{
    return saturateToInt32(value >= 0 ? value + 0.5 : value - 0.5);
}

} // namespace

tServo::tServo(zvckmservo_HostTable* host)
    : mutex(zvplat::tFixedStatusGuard().get()), // raises its failure right here
      host(host), idleState(*this, *this, *this), frequencyLockState(*this, *this, *this),
      phaseLockState(*this, *this, *this), snapTimeState(*this, *this, *this),
      currentState(&idleState)
{
    {
        zverr::tStatusGuard status;
        maxFrequencyOffset = static_cast<double>(host->getMaxFrequencyOffset(&status)) * kPerPpb;
    }
    {
        zverr::tStatusGuard status;
        minFrequencyOffset = static_cast<double>(host->getMinFrequencyOffset(&status)) * kPerPpb;
    }
    tServo::setState(kStateFrequencyLock);
}

void tServo::clearHistory()
{
    const tMutexGuard lock(mutex);
    setState(kStateFrequencyLock);
}

void tServo::adjustTime(const tTimeSpan& reference, const tTimeSpan& clock)
{
    const tMutexGuard lock(mutex);
    currentState->adjustTime(reference, clock);
}

void tServo::setState(tServoStateId id)
{
    iServoState& next = stateOf(id);
    const tMutexGuard lock(mutex);
    currentState->exit();
    currentState = &next;
    currentState->enter();
}

iServoState& tServo::stateOf(tServoStateId id)
{
    switch (id) {
    case kStateFrequencyLock:
        return frequencyLockState;
    case kStateSnapTime:
        return snapTimeState;
    case kStatePhaseLock:
        return phaseLockState;
    case kStateIdle:
        break;
    }
    return idleState;
}

tTimeSpan tServo::getTime()
{
    const tMutexGuard lock(mutex);
    uint64_t timeNs = 0;
    {
        zverr::tStatusGuard status;
        host->getTime(&timeNs, &status);
    }
    return tTimeSpan(timeNs);
}

void tServo::stepTime(const tTimeSpan& delta)
{
    const tMutexGuard lock(mutex);
    {
        zverr::tStatusGuard status;
        host->stepTime(delta.toNanoseconds(), &status);
    }
}

double tServo::getFrequency()
{
    const tMutexGuard lock(mutex);
    int32_t offsetPpb = 0;
    {
        zverr::tStatusGuard status;
        host->getFrequency(&offsetPpb, &status);
    }
    return 1.0 + static_cast<double>(offsetPpb) * kPerPpb;
}

void tServo::setFrequency(double ratio)
{
    const int32_t offsetPpb = roundToInt32((ratio - 1.0) * 1e9);
    const tMutexGuard lock(mutex);
    {
        zverr::tStatusGuard status;
        host->setFrequency(offsetPpb, &status);
    }
}

} // namespace zvckmDravik
