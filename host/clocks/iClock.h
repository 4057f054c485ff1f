#pragma once

#include <cstdint>

namespace dravikHost {

// A clock that can be disciplined. Any operation may throw; the failure reaches the plug-in as a
// negative status code. Positive offsets make it run faster, positive steps move it forward.
class iClock
{
public:
    virtual ~iClock() = default;

    virtual uint64_t timeNs() = 0;
    virtual void step(int64_t deltaNs) = 0;

    // Offset of the rate from nominal that is in force, and what it may be set to. A clock may
    // round what it is given, and then tells what it took.
    virtual double offsetPpb() = 0;
    virtual void setOffsetPpb(double offsetPpb) = 0;
    virtual int32_t maxOffsetPpb() = 0;
    virtual int32_t minOffsetPpb() = 0;
};

// The machine's clock and another one at the same moment, as nearly as can be had.
struct tCrossReading {
    uint64_t systemNs; // CLOCK_REALTIME
    uint64_t clockNs;
    uint64_t windowNs; // within which both were read; 0: they are one clock, or read in hardware
};

// A clock that runs in real time.
class iLiveClock : public iClock
{
public:
    virtual tCrossReading crossRead() = 0;
};

} // namespace dravikHost
