#pragma once

#include "design/tNoiseModel.h"
#include "traces/tRecording.h"

namespace dravikHost {

struct tNoiseEstimate : tNoiseModel {
    // The wander may be anything between, at odds of 20 to 1; 0: even none.
    double leastWanderPpb = 0;
    double mostWanderPpb = 0;

    bool noiseTold = true; // or lost in the oscillator's, or in the steps of the timestamps
    bool frequencyNoiseTold = true; // or lost in the noise of the measurements
};

// The noise of the measurements and the wander of the oscillator in a recording, its corrections
// undone: those under which the recording is most likely, as the innovations of a Kalman filter
// tell. Outliers are counted apart. Throws std::runtime_error if corrections are not known, or for
// less than a hundred measurements.
tNoiseEstimate estimateNoise(const tRecording& recording);

} // namespace dravikHost
