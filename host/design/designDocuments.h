#pragma once

#include "design/tNoiseModel.h"
#include "design/tTrial.h"
#include "servo/tServoParameters.h"

// The documents that suit a noise, by theory and by simulations through the plug-in.
struct tDesign {
    tServoParameters quiet; // to hold the lock
    double theoreticalRmsNs = 0;

    // To acquire it, if the quiet loop would be slow: for how long, and over what time to measure
    // the frequency before.
    tServoParameters quick;
    int64_t quickNs = 0; // 0: not needed
    int64_t measureOverNs = 0;
};

// Throws std::runtime_error if no document can have such gains.
tDesign designDocuments(const tServoLibrary& library, const tNoiseModel& model);

// The least threshold, in seconds, that such errors, outliers included, as good as never reach.
double snapThresholdFor(const tNoiseModel& model);

// A filter that lets noise pass and limits outliers.
void setSpikeFilter(tServoParameters& parameters, const tNoiseModel& model);
