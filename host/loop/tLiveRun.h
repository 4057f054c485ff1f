#pragma once

#include "clocks/tGuardedClock.h"
#include "loop/tDiscipline.h"
#include "loop/tHoldover.h"
#include "loop/tRunMonitor.h"
#include "loop/tSanityCheck.h"
#include "loop/tSignals.h"
#include "sources/iLiveSource.h"

#include <string>

struct tLiveRunOptions {
    tDisciplineOptions discipline;
    tClockGuards guards;
    tRunMonitor::tOptions monitor;
    double sanityLimitPpb = 0;
    int64_t silenceNs = 0;      // after which it is a holdover
    int64_t longHoldoverNs = 0; // after which the servo begins anew
};

// A discipline in real time: a reference that may fall silent or leap, a clock that others may
// touch, people and agents that watch, and documents that change.
class tLiveRun
{
public:
    // All are borrowed.
    tLiveRun(const tServoLibrary& library, iClock& clock, tSignals& signals,
             const tLiveRunOptions& options);

    // Until the source ends.
    void run(const std::string& scenario, iLiveSource& source);

private:
    void take(const tPair& pair);
    void endHoldover(const tPair& pair);
    void silence(int64_t elapsedNs);
    void reload(int64_t elapsedNs);
    double inForcePpb() const;
    tRunMonitor::tState state(int64_t elapsedNs) const;

    tSignals& signals;
    const tLiveRunOptions& options;
    tGuardedClock clock;
    tDiscipline discipline;
    double heldPpb; // in a dry run the offset stays what it is
    tSanityCheck sanity;
    tHoldover holdover;
    tRunMonitor monitor;
};
