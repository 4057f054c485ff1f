#pragma once

#include "clocks/tSteeredClock.h"

// A clock whose oscillator behaves as a recorded one did: its own error is given for each stretch
// of time, and what it is ordered comes on top.
class tFreedClock : public tSteeredClock
{
public:
    tFreedClock(uint64_t startNs, int32_t maxOffsetPpb) : tSteeredClock(startNs, 0, maxOffsetPpb) {}

    void advance(int64_t trueNs, double ownErrorNs) { pass(trueNs, ownErrorNs); }
};
