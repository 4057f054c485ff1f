#pragma once

#include "clocks/tSteeredClock.h"
#include "sources/tNoise.h"

struct tOscillatorModel {
    double frequencyErrorPpb = 0;  // at the start; positive is fast
    double frequencyNoisePpb = 0;  // white: Allan deviation at 1 s
    double frequencyWanderPpb = 0; // random walk: standard deviation after 1 s
};

// A clock on a modelled oscillator. Its time passes only in advance().
class tSimulatedClock : public tSteeredClock
{
public:
    // The noise is borrowed.
    tSimulatedClock(uint64_t startNs, const tOscillatorModel& oscillator, int32_t maxOffsetPpb,
                    tNoise& randomness);

    void advance(int64_t trueNs);

private:
    tOscillatorModel model;
    tNoise& noise;
};
