#pragma once

#include "clocks/tGuardedClock.h"
#include "loop/tDiscipline.h"
#include "loop/tHoldoverEstimate.h"
#include "loop/tSanityCheck.h"
#include "sources/tSignals.h"

#include <string>

namespace dravikHost {

struct tLiveRunOptions {
    tDisciplineOptions discipline;
    std::optional<int64_t> maxStepNs; // either way; a larger one ends the run
    bool noStepAfterLock = false;     // after the first lock a step ends the run
    double sanityLimitPpb = 0;
    int64_t silenceNs = 0;      // after which it is a holdover
    int64_t longHoldoverNs = 0; // after which the servo begins anew
};

// A discipline in real time, and its policy: what becomes of a reference that falls silent or
// leaps, of a clock that others touch, of steps that nobody wants, and of documents that change.
class tLiveRun
{
public:
    // All are borrowed.
    tLiveRun(const tServoLibrary& library, iClock& clock, tSignals& signals,
             const tLiveRunOptions& options, iStepObserver& observers);

    // Until the source ends.
    void run(const std::string& scenario, iPairSource& source);

private:
    void requireStep(int64_t deltaNs) const;
    void take(const tPair& pair);
    void endSilence(const tPair& pair);
    void checkSanity(const tPair& pair);
    void silence(int64_t elapsedNs);
    void reload(int64_t elapsedNs);

    tSignals& signals;
    const tLiveRunOptions& options;
    iStepObserver& observers;
    tGuardedClock guarded;
    tDiscipline discipline;
    tSanityCheck sanity;
    tHoldoverEstimate estimate;
    bool hadLock = false;
    tLeftOut leftOut;
    int64_t steppedNs = 0;           // the sum of all steps
    std::optional<int64_t> latestNs; // when the latest pair came
    bool isSilent = false;           // for so long that it was noted
};

} // namespace dravikHost
