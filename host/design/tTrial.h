#pragma once

#include "design/kalmanDesign.h"
#include "design/tNoiseModel.h"
#include "servo/tServoLibrary.h"

#include <cstdint>
#include <string>

namespace dravikHost {

// Into how many parts of a ppb a run divides its orders, unless it is told otherwise.
int usualFactor(double snapTimeThreshold);

// What a document is worth: simulations through the plug-in, the rounding of orders and whole
// nanoseconds included; of a row of clocks, at the last one. The lock is acquired without noise, so
// what counts is how it is held.
struct tTrialOptions {
    int64_t settlingPairs; // not counted
    int64_t countedPairs;
    uint64_t seeds; // from 1000 on
};

struct tTrialResult {
    double rmsNs;  // of the true error
    double tailNs; // its eighth moment's root, which rare large errors rule
    double peakNs;
    double lostPerHour; // locks
};

// Throws std::runtime_error if the document is refused.
tTrialResult runTrial(const tServoLibrary& library, const std::string& document,
                      const tNoiseModel& model, const tTrialOptions& options);

// Starts with the noise in them, frequency and step measured through it as a host that comes up
// does it; the clock is 1 ms and 12 ppm off.
struct tStartOptions {
    int64_t pairs; // of each start
    uint64_t starts;
    int64_t measureOverNs = 0;
};

struct tStartResult {
    int64_t neverLocked; // starts, of all
    int64_t failed;      // starts that missed the lock, or lost it in their first half
    int64_t lostEarly;   // locks, in the first half of the pairs
    int64_t lostLate;    // in the second half
    double rmsNs;        // of the true error, in the second half
};

tStartResult runStarts(const tServoLibrary& library, const std::string& document,
                       const tNoiseModel& model, const tStartOptions& options);

// Enough pairs for a loop of such gains to settle and to show its error.
tTrialOptions trialFor(const tLoopGains& gains, const tNoiseModel& model);

} // namespace dravikHost
