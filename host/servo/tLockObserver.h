#pragma once

#include "servo/tHostCall.h"

namespace dravikHost {

enum tLockEvent {
    kNothingNew,
    kFrequencyMeasured,
    kFrequencyAtLimit, // measured, but out of reach: it is measured again
    kStepped,
    kNotStepped, // near enough without
    kLockGained,
    kLockMissed, // too far off for phase lock
    kLockLost,
};

// Infers from the calls of each pair what the plug-in, which does not tell, is doing.
//
//     measuring --set inside the limits--> measured --step or nothing--> snapped --set--> locked
//         ^----------------------------------------------nothing------------'---nothing-----'
//
// At a limit the measurement may count or not, which shows one or two pairs later: a step is
// always a snap, and two pairs in a row that set the frequency are always phase lock.
class tLockObserver
{
public:
    tLockObserver(double minOffsetPpb, double maxOffsetPpb);

    tLockEvent observe(const tHostCalls& callsOfPair);
    void restart(); // the plug-in's history was cleared
    bool locked() const { return state == kLocked; }
    bool measuring() const { return state == kMeasuring; }

private:
    enum tState { kMeasuring, kMeasured, kSnapped, kLocked };

    tLockEvent frequencySet(double offsetPpb, bool again);
    tLockEvent nothingDone();
    tLockEvent enter(tState next, tLockEvent event);

    double minOffsetPpb;
    double maxOffsetPpb;
    tState state = kMeasuring;
    bool setBefore = false; // by the previous pair
};

} // namespace dravikHost
