#include "dravik/clampFrequencyOffset.h"

namespace zvckmDravik {

double clampFrequencyOffset(double offset, const iServoConfig& config)
{
    const double max = config.getMaxFrequencyOffset();
    if (offset > max) return max;
    const double min = config.getMinFrequencyOffset();
    if (offset < min) return min;
    return offset;
}

} // namespace zvckmDravik
