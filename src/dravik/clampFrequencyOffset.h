#pragma once

#include "dravik/iServoConfig.h"

namespace zvckmDravik {

// Keeps a frequency offset within the host's limits. The maximum is tested first, which tells if
// the limits cross; a value that is not a number stays what it is.
double clampFrequencyOffset(double offset, const iServoConfig& config);

} // namespace zvckmDravik
