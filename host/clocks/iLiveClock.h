#pragma once

#include "clocks/iClock.h"
#include "clocks/tCrossReading.h"

// A clock that runs in real time.
class iLiveClock : public iClock
{
public:
    virtual tCrossReading crossRead() = 0;
};
