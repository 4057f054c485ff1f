#pragma once

#include "clocks/iClock.h"
#include "loop/disciplineOptions.h"
#include "loop/tLaterDocuments.h"
#include "loop/tLockObserver.h"
#include "loop/tMeasureSpacing.h"
#include "loop/tReport.h"
#include "loop/tSummary.h"
#include "loop/tTrace.h"
#include "servo/tServoHost.h"
#include "sources/iPairSource.h"

#include <string>

// A clock under discipline, and what people see of it: tunes the servo, hands it pair after pair
// and reports what happens. Throws std::runtime_error at the first failure, once all that led to it
// is in the CSV file.
class tDiscipline
{
public:
    // All are borrowed.
    tDiscipline(const tServoLibrary& library, iClock& clock, const tDisciplineOptions& options);

    void start(const std::string& scenario); // one line for people, without its end
    void take(const tPair& pair);
    void finish();

    // Lets the servo measure anew, as if it had just been made, with its tuning.
    void clearHistory();

    // Reads all documents again, on a servo of its own first: if it throws std::runtime_error, all
    // is as it was.
    void retune();

    void note(int64_t elapsedNs, const std::string& text) { report.note(elapsedNs, text); }
    bool locked() const { return observer.locked(); }
    const tSummary& figures() const { return summary; }
    tReport& reporter() { return report; }

    // All pairs of a source between start and finish.
    void run(const std::string& scenario, iPairSource& source);

private:
    void adjust(const tPair& pair);

    const tServoLibrary& library;
    const tDisciplineOptions& options;
    tTrace trace;
    tReport report;
    tSummary summary;
    tServoHost host;
    tLockObserver observer;
    tMeasureSpacing spacing;
    tLaterDocuments later;
};
