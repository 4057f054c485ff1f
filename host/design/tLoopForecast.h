#pragma once

#include "design/tLoopAnalysis.h"
#include "design/tNoiseModel.h"
#include "servo/tServoLibrary.h"

#include <optional>

namespace dravikHost {

// What white noise of the measurements makes of a stable loop, on a usual oscillator: by theory,
// and by simulations through the plug-in for what theory leaves out, which are the
// rounding of orders and starts in which the frequency is measured through the noise.
struct tLoopForecast {
    double noiseNs;         // of the measurements
    double seenNs;          // deviation of what the threshold is compared with
    double linearNs;        // error of the clock, RMS, if orders had any value
    double roundedNs;       // with orders in their steps
    bool locks;             // at least one start did
    double failing;         // share of starts that miss the lock or lose it again
    double lostPerHour;     // locks, in an hour that begins with a start
    double betterThreshold; // s; one that as good as never loses the lock

    // What would keep nine out of ten of these locks.
    std::optional<int64_t> measureOverNs; // the frequency measured over this time
    bool withoutFilter;
};

tLoopForecast forecastLoop(const tServoLibrary& library, const tServoParameters& parameters,
                           double interval, double noiseNs);

} // namespace dravikHost
