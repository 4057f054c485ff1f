#include "design/tLoopGains.h"

#include "maths/tKalmanFilter.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <stdexcept>

namespace dravikHost {

namespace {

constexpr double kLargestGain = zvckmservo_parameters[zvckmservo_kPhaseLockGain].highest;
constexpr double kLargestA = zvckmservo_parameters[zvckmservo_kPhaseLockCoefficientA].highest;

} // namespace

bool tLoopGains::fit() const { return kp + ki <= kLargestGain * kLargestA; }

// With B = 1 the gain is kp, and A - 1 is ki / kp. The bound of A, or that of the gain, may need
// another B.
void tLoopGains::putInto(tServoParameters& parameters) const
{
    const double sum = kp + ki;
    const double gain = withinBounds(zvckmservo_kPhaseLockGain, std::max(kp, sum / kLargestA));
    if (!fit()) {
        throw std::runtime_error(
            fmt::format("no document can have kp {:.4g} and ki {:.4g} per second", kp, ki));
    }
    parameters.phaseLockGain = gain;
    parameters.phaseLockCoefficientA = sum / gain;
    parameters.phaseLockCoefficientB = kp / gain;
    parameters.phaseLockCoefficientC = 1;
}

tLoopGains tLoopGains::of(const tServoParameters& parameters)
{
    const double g = parameters.phaseLockGain;
    const double a = parameters.phaseLockCoefficientA;
    const double b = parameters.phaseLockCoefficientB;
    return {g * b, g * (a - b)};
}

// Iterates the filter until it stands still, which takes some ten time constants.
tKalmanDesign steadyKalman(const tNoiseModel& model)
{
    constexpr int kMostPairs = 10'000'000;
    constexpr double kStill = 1e-12;
    const double t = model.interval();
    const double r = model.noiseNs * model.noiseNs;
    const tCovariance q = disturbance(model.frequencyNoisePpb, model.wanderPpb, t);
    tKalmanFilter filter;
    filter.covariance = {r, 0, r / (t * t)}; // before a measurement
    tKalmanFilter::tGains gains{};
    for (int pair = 0; pair < kMostPairs; ++pair) {
        const tKalmanFilter::tGains before = gains;
        gains = filter.update(0, r);
        filter.predict(t, q);
        if (std::fabs(gains.phase - before.phase) <= kStill * gains.phase &&
            std::fabs(gains.frequency - before.frequency) <= kStill * gains.frequency)
            break;
    }
    return {{gains.phase / t, gains.frequency}, std::sqrt(filter.covariance.xx)};
}

tLoopGains growingKalman(double pairs, double interval)
{
    const double n = pairs;
    return {(4 * n - 2) / (n * (n + 1)) / interval, 6 / (n * (n + 1)) / interval};
}

} // namespace dravikHost
