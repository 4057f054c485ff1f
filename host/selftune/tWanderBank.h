#pragma once

#include "maths/tKalmanFilter.h"

#include <array>
#include <cstddef>

namespace dravikHost {

// How much the oscillator wanders, as a share of the noise: a bank of filters, each made for one
// ratio, is judged by how well each foretells the next measurement. The judgement has no fixed
// memory; at every pair the ratio may have changed, with a small chance, so that much evidence
// is gathered while nothing changes and little is in the way of a change.
//
// Ratio is the wander in ppb per root second, times interval^1.5 in seconds, over the noise in ns:
// 1 if the oscillator moves as much from pair to pair as a measurement is off by. Covariances are
// in units of the noise's variance. Only + - * / and the root are used, so that machines agree.
class tWanderBank
{
public:
    tWanderBank();

    // From two measurements so many seconds apart; their distance becomes the interval.
    void begin(const tKalmanFilter& start, double seconds);

    void predict(double seconds);
    void take(double phaseNs, double noiseVariance);

    // The clock, and so each filter, is moved.
    void move(double phaseNs, double frequencyPpb, const tCovariance& doubt);

    // The noise is so many times as large as before, the wander is not.
    void noiseGrew(double times);

    double ratio() const;

private:
    static constexpr size_t kModels = 20;
    using tShares = std::array<double, kModels>;

    void normalise();

    std::array<tKalmanFilter, kModels> filters{};
    std::array<double, kModels> wander{};     // by which each filter is widened, per root second
    std::array<tCovariance, kModels> added{}; // in passedSeconds
    double passedSeconds = 0;
    tShares shares{}; // of belief
};

} // namespace dravikHost
