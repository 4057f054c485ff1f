#pragma once

#include "clocks/iClock.h"
#include "clocks/tSteeredClock.h"

namespace dravikHost {

// A clock of the program's own over CLOCK_MONOTONIC_RAW, which no one else steers. It starts wrong
// on purpose; no clock of the machine is touched.
class tSoftClock : public iLiveClock
{
public:
    tSoftClock(uint64_t startNs, double frequencyErrorPpb, int32_t maxOffsetPpb);

    tCrossReading crossRead() override;

    uint64_t timeNs() override;
    void step(int64_t deltaNs) override { clock.step(deltaNs); }
    double offsetPpb() override { return clock.offsetPpb(); }
    void setOffsetPpb(double offsetPpb) override;
    int32_t maxOffsetPpb() override { return clock.maxOffsetPpb(); }
    int32_t minOffsetPpb() override { return clock.minOffsetPpb(); }

private:
    // What the clock shows at a moment of the raw clock, not before the last one asked for.
    uint64_t timeAtRaw(uint64_t rawNs);

    tSteeredClock clock;
    uint64_t lastRawNs;
};

} // namespace dravikHost
