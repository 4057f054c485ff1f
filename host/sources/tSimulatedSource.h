#pragma once

#include "clocks/tSteeredClock.h"
#include "maths/tNoise.h"
#include "sources/iPairSource.h"

namespace dravikHost {

struct tMeasurementModel {
    int64_t intervalNs = 0;
    int64_t durationNs = 0;
    double noiseNs = 0;         // white, standard deviation
    double outlierRate = 0;     // 0 to 1
    double outlierSizeNs = 0;   // added with either sign
    uint64_t granularityNs = 1; // of both timestamps
};

// What one measurement is off by, in ns.
double measurementErrorNs(const tMeasurementModel& model, tNoise& noise);

// Pairs in simulated time: a perfect reference, seen through noise, and the simulated clock.
class tSimulatedSource : public iPairSource
{
public:
    static constexpr uint64_t kStartNs = 1'700'000'000'000'000'000;

    // Clock and noise are borrowed; the clock is moved on from pair to pair.
    tSimulatedSource(tSimulatedClock& clock, const tMeasurementModel& model, tNoise& noise);

    std::optional<tPair> next() override;

private:
    tSimulatedClock& clock;
    tMeasurementModel model;
    tNoise& noise;
    int64_t elapsedNs; // of the pair given last
};

} // namespace dravikHost
