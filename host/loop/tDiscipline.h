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
    // Library and clock are borrowed.
    tDiscipline(const tServoLibrary& library, iClock& clock, const tDisciplineOptions& options);

    void start(const std::string& scenario); // one line for people, without its end
    void take(const tPair& pair);
    void finish();

    // All pairs of a source between the two.
    void run(const std::string& scenario, iPairSource& source);

private:
    void adjust(const tPair& pair);

    tTrace trace;
    tReport report;
    tSummary summary;
    tServoHost host;
    tLockObserver observer;
    tMeasureSpacing spacing;
    tLaterDocuments later;
};
