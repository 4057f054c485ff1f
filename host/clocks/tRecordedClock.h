#pragma once

#include "clocks/iClock.h"

#include <algorithm>

namespace dravikHost {

// A clock of the past, which no order reaches any more: it shows what was recorded. What it is
// ordered counts only where the recording does not say what it ran at.
class tRecordedClock : public iClock
{
public:
    explicit tRecordedClock(int32_t limitPpb) : limitPpb(limitPpb) {}

    void showTime(uint64_t recordedNs) { shownNs = recordedNs; }
    void showOffset(double recordedPpb) // of its rate
    {
        const double limit = limitPpb;
        shownPpb = std::clamp(recordedPpb, -limit, limit);
    }

    uint64_t timeNs() override { return shownNs; }
    void step(int64_t /*deltaNs*/) override {}
    double offsetPpb() override { return shownPpb; }
    void setOffsetPpb(double orderedPpb) override { shownPpb = orderedPpb; }
    int32_t maxOffsetPpb() override { return limitPpb; }
    int32_t minOffsetPpb() override { return -limitPpb; }

private:
    uint64_t shownNs = 0;
    double shownPpb = 0;
    int32_t limitPpb;
};

} // namespace dravikHost
