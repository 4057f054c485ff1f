#pragma once

#include "design/kalmanDesign.h"
#include "design/tNoiseModel.h"
#include "design/tTrial.h"
#include "servo/tServoParameters.h"

#include <functional>
#include <vector>

namespace dravikHost {

// For some time after the lock, in place of the quiet document.
struct tQuickDocument {
    tServoParameters parameters;
    int64_t heldNs;
};

// The documents that suit a noise, by theory and by simulations through the plug-in.
struct tDesign {
    tServoParameters quiet; // to hold the lock
    double theoreticalRmsNs = 0;

    // To acquire it, one after the other, if the quiet loop would be slow; and over what time to
    // measure the frequency before.
    std::vector<tQuickDocument> quick;
    int64_t measureOverNs = 0;
};

// Is told how many simulations have been run.
using tDesignProgress = std::function<void(int trials)>;

// Throws std::runtime_error if no document can have such gains, or the model is absurd.
tDesign designDocuments(
    const tServoLibrary& library, const tNoiseModel& model,
    const tDesignProgress& progress = [](int) {});

// What theory has for the model, with rounding; and what error it has for gains, in ns.
tKalmanDesign theoreticalDesign(const tNoiseModel& model);
double theoreticalErrorNs(const tLoopGains& gains, const tNoiseModel& model);

// With the gains of theory and what suits the noise, nothing simulated.
tServoParameters theoreticalDocument(const tNoiseModel& model);

// Adds the quick documents, if the quiet one of the design needs any.
void addQuick(tDesign& design, const tNoiseModel& model);

// The least threshold, in seconds, that such errors, outliers included, as good as never reach.
double snapThresholdFor(const tNoiseModel& model);

// A filter that lets noise pass and limits outliers.
void setSpikeFilter(tServoParameters& parameters, const tNoiseModel& model);

} // namespace dravikHost
