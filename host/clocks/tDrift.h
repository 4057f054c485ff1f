#pragma once

#include "maths/tFlicker.h"

#include <cstdint>

namespace dravikHost {

// What moves an oscillator slowly, beside the walk of its frequency.
struct tDriftModel {
    double flickerPpb = 0; // Allan deviation, the same over all times
    double sinePpb = 0;    // of temperature, say: how far to either side; it begins upwards
    int64_t sinePeriodNs = 0;
    double rampPpb = 0; // in each second
};

class tDrift
{
public:
    explicit tDrift(uint64_t seed);

    // The mean of the frequency that it adds over the stretch of time that comes next.
    double nextPpb(const tDriftModel& model, int64_t stretchNs);

private:
    tFlicker flicker;
    double turns = 0; // of the sinusoid, 0 to 1
    double rampedPpb = 0;
};

} // namespace dravikHost
