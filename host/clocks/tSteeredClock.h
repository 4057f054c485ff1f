#pragma once

#include "clocks/iClock.h"

// A clock that the program keeps itself, on an oscillator that is a little off: it passes
// (1 + oscillator's error) * (1 + ordered offset) seconds in each true one.
class tSteeredClock : public iClock
{
public:
    tSteeredClock(uint64_t startNs, double frequencyErrorPpb, int32_t maxOffsetPpb);

    uint64_t timeNs() override { return wholeNs; }
    void step(int64_t deltaNs) override;
    int32_t offsetPpb() override { return orderedPpb; }
    void setOffsetPpb(int32_t offsetPpb) override;
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
    int32_t orderedPpb = 0;
    int32_t limitPpb;
};
