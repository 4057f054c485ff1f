#pragma once

#include "clocks/iClock.h"
#include "clocks/tDrift.h"
#include "maths/tNoise.h"

namespace dravikHost {

// A clock that the program keeps itself, on an oscillator that is a little off: it passes
// (1 + oscillator's error) * (1 + ordered offset) seconds in each true one.
class tSteeredClock : public iClock
{
public:
    tSteeredClock(uint64_t startNs, double frequencyErrorPpb, int32_t maxOffsetPpb);

    uint64_t timeNs() override { return wholeNs; }
    void step(int64_t deltaNs) override;
    double offsetPpb() override { return orderedPpb; }
    void setOffsetPpb(double offsetPpb) override;
    int32_t maxOffsetPpb() override { return limitPpb; }
    int32_t minOffsetPpb() override { return -limitPpb; }

    // Fractions of a nanosecond included; positive: the clock is ahead.
    double aheadOfNs(uint64_t trueNs) const;

    void pass(int64_t trueNs, double phaseNoiseNs = 0);

protected:
    double frequencyError; // of the oscillator: a fraction, positive is fast

private:
    uint64_t wholeNs;      // apart from the fraction, so that years keep their nanosecond
    double fractionNs = 0; // 0 to 1
    double orderedPpb = 0;
    int32_t limitPpb;
};

struct tOscillatorModel {
    double frequencyErrorPpb = 0;  // at the start; positive is fast
    double frequencyNoisePpb = 0;  // white: Allan deviation at 1 s
    double frequencyWanderPpb = 0; // random walk: standard deviation after 1 s
    tDriftModel drift{};
};

// A clock on a modelled oscillator. Its time passes only in advance().
class tSimulatedClock : public tSteeredClock
{
public:
    // The noise is borrowed; that of the drift has the seed.
    tSimulatedClock(uint64_t startNs, const tOscillatorModel& model, int32_t maxOffsetPpb,
                    tNoise& noise, uint64_t seed = 0);

    void advance(int64_t trueNs);

    // From here on; the frequency goes on from where it is.
    void become(const tOscillatorModel& next) { model = next; }
    void changeFrequency(double byPpb) { frequencyError += byPpb * 1e-9; }

private:
    tOscillatorModel model;
    tNoise& noise;
    tDrift drift;
};

// A clock whose oscillator behaves as a recorded one did: its own error is given for each stretch
// of time, and what it is ordered comes on top.
class tFreeRunningClock : public tSteeredClock
{
public:
    tFreeRunningClock(uint64_t startNs, int32_t maxOffsetPpb)
        : tSteeredClock(startNs, 0, maxOffsetPpb)
    {}

    void advance(int64_t trueNs, double ownErrorNs) { pass(trueNs, ownErrorNs); }
};

// A clock that stands still, for a servo that is given documents but no pairs.
class tStillClock : public tSteeredClock
{
public:
    tStillClock() : tSteeredClock(0, 0, 0) {}
};

} // namespace dravikHost
