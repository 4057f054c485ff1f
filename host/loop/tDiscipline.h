#pragma once

#include "clocks/iClock.h"
#include "loop/tLaterDocuments.h"
#include "loop/tMeanOrders.h"
#include "loop/tMeasureSpacing.h"
#include "loop/tStep.h"
#include "selftune/tSelfTuning.h"
#include "servo/tFineServo.h"
#include "servo/tuning.h"

#include <string>
#include <vector>

namespace dravikHost {

// What every verb that disciplines a clock has.
struct tDisciplineOptions {
    int32_t maxFrequencyOffsetPpb = 0;
    int factor = tFineServo::kFinest; // at most so many parts of a ppb are ordered
    int64_t measureOverNs = 0;
    std::vector<tLaterDocument> later; // in the order of their times
    std::string csv;                   // "": none; "-": stdout
    bool selfTune = false;
    int hops = 1;        // clocks in a row, for the last of which self-tuning is to be best
    bool dryRun = false; // no order reaches the clock
    tTuning tuning;
    std::string library;
};

// A clock under discipline: a tuned servo is handed pair after pair, and each becomes one step.
class tDiscipline
{
public:
    // All are borrowed. Throws std::runtime_error if the servo cannot be made or tuned.
    tDiscipline(const tServoLibrary& library, iClock& clock, const tDisciplineOptions& options);

    // The calls that made the servo, and what is to be known of its documents.
    const tHostCalls& firstCalls() const { return callsThatMadeIt; }
    const tNotes& notes() const { return tuned.notes; }

    tStep take(const tPair& pair);

    // There was no pair by then.
    tSilence wait(int64_t elapsedNs);

    // Lets the servo measure anew, as if it had just been made, with its tuning.
    void clearHistory();

    // Reads all documents again: if it throws std::runtime_error, all is as it was. Returns what is
    // to be known of them.
    tNotes retune();

private:
    // All documents of the run, as they are taken by a servo of their own, and so in real units.
    struct tTuned {
        tNotes notes;
        tLaterDocuments documents;
    };
    static tTuned readDocuments(const tServoLibrary& library, const tDisciplineOptions& options);

    bool isToBeHanded(const tPair& pair, tStep& step);
    void hand(const tPair& pair, tStep& step);
    void followOrders(tStep& step);
    void resumeLaw(tStep& step);
    void order(double ppb, tHostCalls& calls);

    const tServoLibrary& library;
    const tDisciplineOptions& options;
    tTuned tuned;
    iClock& clock;
    tFineServo servo;
    std::optional<tSelfTuning> selfTuning;
    tHostCalls callsThatMadeIt;
    tMeasureSpacing spacing;
    tMeanOrders meanOrders;
    double inForcePpb;
    int64_t steps = 0;
    int64_t locksLost = 0;
};

// All pairs of a source, one step each. The first failure of the servo ends it, and is thrown once
// the observers have seen the end.
void disciplineAll(tDiscipline& discipline, iPairSource& source, const std::string& scenario,
                   iStepObserver& observers);

// Shows how a discipline begins.
void begin(const tDiscipline& discipline, const std::string& scenario, iStepObserver& observers);

// Shows a step, and throws its failure if there is one.
void show(const tStep& step, iStepObserver& observers);

} // namespace dravikHost
