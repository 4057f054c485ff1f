#include "clocks/tSoftClock.h"

#include "clocks/systemTime.h"

namespace dravikHost {

tSoftClock::tSoftClock(uint64_t startNs, double frequencyErrorPpb, int32_t maxOffsetPpb)
    : clock(startNs, frequencyErrorPpb, maxOffsetPpb), lastRawNs(rawTimeNs())
{}

tCrossReading tSoftClock::crossRead()
{
    const tCrossReading raw = crossReadSystem(CLOCK_MONOTONIC_RAW);
    return {raw.systemNs, timeAtRaw(raw.clockNs), raw.windowNs};
}

uint64_t tSoftClock::timeNs() { return timeAtRaw(rawTimeNs()); }

// The time up to now has passed at the old rate.
void tSoftClock::setOffsetPpb(double offsetPpb)
{
    timeNs();
    clock.setOffsetPpb(offsetPpb);
}

uint64_t tSoftClock::timeAtRaw(uint64_t rawNs)
{
    clock.pass(static_cast<int64_t>(rawNs - lastRawNs));
    lastRawNs = rawNs;
    return clock.timeNs();
}

} // namespace dravikHost
