#pragma once

#include "maths/tFlicker.h"
#include "sources/iPairSource.h"
#include "sources/tScenario.h"

namespace dravikHost {

// What one measurement is off by, in ns, of noise and outliers of either sign.
double measurementErrorNs(const tMeasurementModel& model, tNoise& noise);

// Pairs in simulated time: a reference, seen through noise, and the simulated clock. A phase of the
// scenario begins with the first pair that is not before it.
class tSimulatedSource : public iPairSource
{
public:
    static constexpr uint64_t kStartNs = 1'700'000'000'000'000'000;

    // Clock and noise are borrowed; the clock, which is as the first phase says, is moved on from
    // pair to pair. What comes beside that noise has the seed. The reference is the true time, or
    // else a clock that is borrowed too.
    tSimulatedSource(tSimulatedClock& clock, tScenario scenario, tNoise& noise, uint64_t seed = 0,
                     tSimulatedClock* referenceClock = nullptr);

    std::optional<tMoment> next() override;

private:
    void enterPhases();
    tPair measure();
    double delayNs();
    bool comes();

    tSimulatedClock& clock;
    tSimulatedClock* referenceClock;
    tScenario scenario;
    tPhase now;
    size_t entered = 1; // phases so far
    tNoise& noise;
    tNoise chances, delays, misses;
    tFlicker flicker;
    int64_t elapsedNs; // of the latest pair
    int64_t jumpedNs = 0;
};

} // namespace dravikHost
