#include "design/kalmanDesign.h"

#include "maths/tKalmanFilter.h"

#include <cmath>

namespace dravikHost {

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
