#pragma once

#include "clocks/iClock.h"

#include <ctime>
#include <functional>
#include <string>
#include <sys/timex.h>

namespace dravikHost {

// A clock that the kernel keeps: CLOCK_REALTIME, or a PTP hardware clock.
class tKernelClock : public iLiveClock
{
public:
    // The name is for people. The limit is the program's own; the kernel may have a narrower one.
    tKernelClock(clockid_t id, std::string name, int32_t limitPpb,
                 std::function<tCrossReading()> reader);

    // Sets the frequency to what it is: who may not do so finds out at once.
    void requireSettable();

    tCrossReading crossRead() override { return reader(); }

    uint64_t timeNs() override;
    void step(int64_t deltaNs) override;
    double offsetPpb() override;
    void setOffsetPpb(double offsetPpb) override;
    int32_t maxOffsetPpb() override { return limitPpb; }
    int32_t minOffsetPpb() override { return -limitPpb; }

private:
    timex adjust(timex request, const char* deed);

    clockid_t id;
    std::string name;
    int32_t limitPpb;
    std::function<tCrossReading()> reader;
};

// The kernel counts in 2^-16 ppm, a little less than 1/64 ppb.
long kernelFrequency(double offsetPpb); // the nearest
double ppbOfKernelFrequency(long frequency);

} // namespace dravikHost
