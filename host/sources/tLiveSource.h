#pragma once

#include "clocks/systemTime.h"
#include "sources/iPairSource.h"
#include "sources/iReference.h"
#include "sources/tSignals.h"

namespace dravikHost {

// Pairs measured on this machine, at the pace of real time: what a reference says, and what the
// clock showed at that moment.
class tLiveSource : public iPairSource
{
public:
    struct tOptions {
        int64_t referenceOffsetNs = 0;     // added to what the reference says
        std::optional<int64_t> durationNs; // else the signal is the only end
        uint64_t (*rawNs)() = rawTimeNs;   // CLOCK_MONOTONIC_RAW
    };

    // All are borrowed.
    tLiveSource(iLiveClock& clock, iReference& reference, const tSignals& signals,
                const tOptions& options);

    std::optional<tMoment> next() override;
    std::string remarks() const override;

private:
    struct tReading {
        int64_t elapsedNs;
        tCrossReading reading;
    };

    int64_t elapsedNs() const;
    tLeftOut leftOut() const;
    std::optional<tReading> crossRead();
    bool ranEvenly(const tReading& now) const;
    tPair pairAt(const tReferenceSample& sample, const tReading& now) const;

    iLiveClock& clock;
    iReference& reference;
    const tSignals& signals;
    tOptions options;
    uint64_t startRawNs;
    std::optional<tReading> ordered; // since when the clock has not been ordered anything
    int64_t outOfDate = 0;           // samples
    int64_t unread = 0;              // samples, as the clock could not be read then
};

} // namespace dravikHost
