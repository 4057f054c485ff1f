#pragma once

#include "clocks/tSteeredClock.h"

// A clock of the program's own over CLOCK_MONOTONIC_RAW, which no one else steers. It starts wrong
// on purpose; no clock of the machine is touched.
class tSoftClock : public tSteeredClock
{
public:
    tSoftClock(uint64_t startNs, double frequencyErrorPpb, int32_t maxOffsetPpb);

    uint64_t timeNs() override;
    void setOffsetPpb(int32_t offsetPpb) override;

    // What the clock shows at a moment of the raw clock, not before the last one asked for.
    uint64_t timeAtRaw(uint64_t rawNs);

private:
    uint64_t lastRawNs;
};
