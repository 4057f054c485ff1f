#include "servo/tLockObserver.h"

namespace dravikHost {

tLockObserver::tLockObserver(double minOffsetPpb, double maxOffsetPpb)
    : minOffsetPpb(minOffsetPpb), maxOffsetPpb(maxOffsetPpb)
{}

tLockEvent tLockObserver::observe(const tHostCalls& callsOfPair)
{
    const tHostCall* const set = findCall(callsOfPair, kSetFrequency);
    const bool again = setBefore;
    setBefore = set != nullptr;
    if (set != nullptr) return frequencySet(set->ppb, again);
    if (findCall(callsOfPair, kStepTime) != nullptr) return enter(kSnapped, kStepped);
    return nothingDone();
}

void tLockObserver::restart()
{
    state = kMeasuring;
    setBefore = false;
}

tLockEvent tLockObserver::frequencySet(double offsetPpb, bool again)
{
    if (state == kLocked) return kNothingNew;
    if (state == kSnapped || again) return enter(kLocked, kLockGained);
    const bool inside = offsetPpb > minOffsetPpb && offsetPpb < maxOffsetPpb;
    return inside ? enter(kMeasured, kFrequencyMeasured) : enter(kMeasuring, kFrequencyAtLimit);
}

tLockEvent tLockObserver::nothingDone()
{
    switch (state) {
    case kMeasured:
        return enter(kSnapped, kNotStepped);
    case kSnapped:
        return enter(kMeasuring, kLockMissed);
    case kLocked:
        return enter(kMeasuring, kLockLost);
    case kMeasuring:
        break;
    }
    return kNothingNew;
}

tLockEvent tLockObserver::enter(tState next, tLockEvent event)
{
    state = next;
    return event;
}

} // namespace dravikHost
