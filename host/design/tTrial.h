#pragma once

#include "design/tLoopGains.h"
#include "design/tNoiseModel.h"
#include "servo/tServoLibrary.h"

#include <cstdint>
#include <string>

namespace dravikHost {

// What a document is worth: simulations through the plug-in, whole parts per billion and whole
// nanoseconds included. The lock is acquired without noise, so what counts is how it is held.
struct tTrialOptions {
    int64_t settlingPairs; // not counted
    int64_t countedPairs;
    uint64_t seeds; // from 1000 on
};

struct tTrialResult {
    double rmsNs = 0;  // of the true error
    double tailNs = 0; // its eighth moment's root, which rare large errors rule
    double peakNs = 0;
    double lostPerHour = 0; // locks
};

// Throws std::runtime_error if the document is refused.
tTrialResult runTrial(const tServoLibrary& library, const std::string& document,
                      const tNoiseModel& model, const tTrialOptions& options);

// Enough pairs for a loop of such gains to settle and to show its error.
tTrialOptions trialFor(const tLoopGains& gains, const tNoiseModel& model);

} // namespace dravikHost
