#pragma once

#include "zvckmservo/servo.h"

// The yardstick: a proportional-integral controller as a textbook has it, behind the same call.
// No lock, no states, no status of its own, no limits but the clamp.
class tTextbookController
{
public:
    // Both gains are divided by the seconds from pair to pair, so that the loop is the same per
    // pair at every interval. The integral starts from the offset that the clock has.
    explicit tTextbookController(double intervalSeconds = 1.0, double offsetPpb = 0.0);

    // One pair, and the offset set through the host's table.
    void adjustTime(zvckmservo_HostTable* host, uint64_t referenceTime, uint64_t clockTime,
                    zverr_Status* status);

    // The arithmetic alone: the new frequency offset in parts per billion.
    int32_t nextOffsetPpb(uint64_t referenceTime, uint64_t clockTime);

private:
    double proportionalGain; // parts per billion per nanosecond
    double integralGain;
    double integral; // parts per billion
};
