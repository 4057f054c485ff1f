#pragma once

#include "dravik/tTimeSpan.h"

namespace zvckmDravik {

// The states' way to the clock. A ratio is the clock's rate over its nominal rate, around 1.0; a
// frequency offset is a ratio minus 1. A failure of the host's operation is raised.
class iTimekeeper
{
public:
    virtual ~iTimekeeper() = default;

    virtual void stepTime(const tTimeSpan& delta) = 0; // positive moves the clock forward
    virtual double getFrequency() = 0;
    virtual void setFrequency(double ratio) = 0; // sent in whole parts per billion
};

} // namespace zvckmDravik
