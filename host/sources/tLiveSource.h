#pragma once

#include "clocks/tSoftClock.h"
#include "loop/tStopSignal.h"
#include "sources/iPairSource.h"

// Pairs measured on this machine, at the pace of real time: CLOCK_REALTIME is the reference.
class tLiveSource : public iPairSource
{
public:
    // Clock and signal are borrowed. Without a duration the signal is the only end.
    tLiveSource(tSoftClock& softClock, const tStopSignal& stopSignal, int64_t paceNs,
                std::optional<int64_t> lengthNs);

    std::optional<tPair> next() override;

private:
    bool sleepUntil(int64_t momentNs) const;
    int64_t elapsedNs() const;

    tSoftClock& clock;
    const tStopSignal& stop;
    int64_t intervalNs;
    std::optional<int64_t> durationNs;
    uint64_t startRawNs;
    int64_t dueNs = 0; // of the next pair, since the start
};
