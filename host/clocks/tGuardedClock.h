#pragma once

#include "clocks/iClock.h"

#include <cstdint>
#include <optional>

// What a clock that matters is protected from.
struct tClockGuards {
    std::optional<int64_t> maxStepNs; // either way
    bool noStepAfterLock = false;
};

// A clock behind guards. A step that a guard refuses throws std::runtime_error: an offset that
// large is no matter for a servo, but for a person.
class tGuardedClock : public iClock
{
public:
    // The clock is borrowed. In a dry run no order reaches it.
    tGuardedClock(iClock& guarded, const tClockGuards& options, bool isDryRun)
        : clock(guarded), guards(options), dryRun(isDryRun)
    {}

    void setLocked(bool isLocked) { wasLocked = wasLocked || isLocked; }

    // The sum of all steps, those that a dry run held back apart.
    int64_t steppedNs() const { return sumNs; }

    uint64_t timeNs() override { return clock.timeNs(); }
    void step(int64_t deltaNs) override;
    int32_t offsetPpb() override { return clock.offsetPpb(); }
    void setOffsetPpb(int32_t offsetPpb) override;
    int32_t maxOffsetPpb() override { return clock.maxOffsetPpb(); }
    int32_t minOffsetPpb() override { return clock.minOffsetPpb(); }

private:
    iClock& clock;
    tClockGuards guards;
    bool dryRun;
    bool wasLocked = false;
    int64_t sumNs = 0;
};
