#include "clocks/tSoftClock.h"

#include "clocks/systemTime.h"

tSoftClock::tSoftClock(uint64_t startNs, double frequencyErrorPpb, int32_t maxOffsetPpb)
    : tSteeredClock(startNs, frequencyErrorPpb, maxOffsetPpb),
      lastRawNs(systemTimeNs(CLOCK_MONOTONIC_RAW))
{}

uint64_t tSoftClock::timeNs() { return timeAtRaw(systemTimeNs(CLOCK_MONOTONIC_RAW)); }

// The time up to now has passed at the old rate.
void tSoftClock::setOffsetPpb(int32_t offsetPpb)
{
    timeNs();
    tSteeredClock::setOffsetPpb(offsetPpb);
}

uint64_t tSoftClock::timeAtRaw(uint64_t rawNs)
{
    pass(static_cast<int64_t>(rawNs - lastRawNs));
    lastRawNs = rawNs;
    return tSteeredClock::timeNs();
}
