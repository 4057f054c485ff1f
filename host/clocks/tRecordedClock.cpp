#include "clocks/tRecordedClock.h"

#include <algorithm>
#include <cmath>

void tRecordedClock::showOffset(double recordedPpb)
{
    const double limit = limitPpb;
    shownPpb = static_cast<int32_t>(std::lround(std::clamp(recordedPpb, -limit, limit)));
}
