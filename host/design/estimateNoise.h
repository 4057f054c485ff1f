#pragma once

#include "design/tNoiseModel.h"
#include "traces/tRecording.h"

namespace dravikHost {

// The noise of the measurements and the wander of the oscillator in a recording, its corrections
// undone: those under which the recording is most likely, as the innovations of a Kalman filter
// tell. Outliers are counted apart. Throws std::runtime_error if corrections are not known, or for
// less than a hundred measurements.
tNoiseModel estimateNoise(const tRecording& recording);

} // namespace dravikHost
