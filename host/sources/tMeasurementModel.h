#pragma once

#include <cstdint>

namespace dravikHost {

struct tMeasurementModel {
    int64_t intervalNs = 0;
    int64_t durationNs = 0;
    double noiseNs = 0;         // white, standard deviation
    double outlierRate = 0;     // 0 to 1
    double outlierSizeNs = 0;   // added with either sign
    uint64_t granularityNs = 1; // of both timestamps
    double delayedRate = 0;     // 0 to 1, of outliers that are late only
    double delayNs = 0;         // exponential: its mean; the reference is seen late by so much
    double flickerNs = 0;       // TDEV, the same over all times
    double missingRate = 0;     // 0 to 1, of pairs that do not come
};

} // namespace dravikHost
