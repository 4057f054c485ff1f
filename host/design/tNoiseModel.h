#pragma once

#include "text/quantity.h"

#include <cstdint>

namespace dravikHost {

// What disturbs a loop. A frequency of 1 ppb is 1 ns per second, so phases are in ns throughout.
struct tNoiseModel {
    int64_t intervalNs = 0;       // from pair to pair
    double noiseNs = 0;           // of each measurement; white, standard deviation
    double frequencyNoisePpb = 0; // white, of the oscillator; Allan deviation at 1 s
    double wanderPpb = 0;         // random walk of its frequency; standard deviation after 1 s
    double outlierRate = 0;       // share of measurements that are far off
    double outlierSizeNs = 0;     // by which they are, with either sign

    int64_t granularityNs = 1; // timestamps are cut down to its multiples
    int hops = 1;              // clocks in a row, all alike; the error is that of the last one

    double interval() const { return secondsOf(intervalNs); } // s
};

} // namespace dravikHost
