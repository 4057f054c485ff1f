#pragma once

#include "clocks/tSoftClock.h"
#include "loop/tSignals.h"
#include "sources/iLiveSource.h"

// Pairs measured on this machine, at the pace of real time: CLOCK_REALTIME is the reference.
class tLiveSource : public iLiveSource
{
public:
    // Clock and signals are borrowed. Without a duration the signal is the only end.
    tLiveSource(tSoftClock& softClock, const tSignals& watched, int64_t paceNs,
                std::optional<int64_t> lengthNs);

    std::optional<tLiveMoment> next() override;

private:
    int64_t elapsedNs() const;

    tSoftClock& clock;
    const tSignals& signals;
    int64_t intervalNs;
    std::optional<int64_t> durationNs;
    uint64_t startRawNs;
    int64_t dueNs = 0; // of the next pair, since the start
};
