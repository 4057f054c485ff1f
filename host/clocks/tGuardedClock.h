#pragma once

#include "clocks/iClock.h"

#include <functional>
#include <utility>

namespace dravikHost {

// A clock behind a guard, who may refuse a step. In a dry run no order reaches it.
class tGuardedClock : public iClock
{
public:
    // The clock is borrowed. The guard throws if a step by so many nanoseconds is not to be.
    tGuardedClock(iClock& clock, std::function<void(int64_t deltaNs)> guard, bool dryRun)
        : clock(clock), guard(std::move(guard)), dryRun(dryRun)
    {}

    uint64_t timeNs() override { return clock.timeNs(); }
    void step(int64_t deltaNs) override
    {
        guard(deltaNs);
        if (!dryRun) clock.step(deltaNs);
    }
    double offsetPpb() override { return clock.offsetPpb(); }
    void setOffsetPpb(double offsetPpb) override
    {
        if (!dryRun) clock.setOffsetPpb(offsetPpb);
    }
    int32_t maxOffsetPpb() override { return clock.maxOffsetPpb(); }
    int32_t minOffsetPpb() override { return clock.minOffsetPpb(); }

private:
    iClock& clock;
    std::function<void(int64_t)> guard;
    bool dryRun;
};

} // namespace dravikHost
