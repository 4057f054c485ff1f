#include "design/kalmanGains.h"

#include <cmath>

// Iterates the filter until it stands still, which takes some ten time constants.
tKalmanDesign steadyKalman(const tNoiseModel& model)
{
    constexpr int kMostPairs = 10'000'000;
    const double t = model.interval();
    const double r = model.noiseNs * model.noiseNs;
    const tCovariance q = disturbance(model.frequencyNoisePpb, model.wanderPpb, t);
    tCovariance p = {r, 0, r / (t * t)}; // before a measurement
    double k1 = 0;
    double k2 = 0;
    for (int pair = 0; pair < kMostPairs; ++pair) {
        const double before1 = k1;
        const double before2 = k2;
        k1 = p.xx / (p.xx + r);
        k2 = p.xy / (p.xx + r);
        const tCovariance known = {p.xx - k1 * p.xx, p.xy - k1 * p.xy, p.yy - k2 * p.xy};
        p = {known.xx + t * (2 * known.xy + t * known.yy) + q.xx, known.xy + t * known.yy + q.xy,
             known.yy + q.yy};
        if (std::fabs(k1 - before1) <= 1e-12 * k1 && std::fabs(k2 - before2) <= 1e-12 * k2) break;
    }
    return {{k1 / t, k2}, std::sqrt(p.xx)};
}

tLoopGains growingKalman(double pairs, double interval)
{
    const double n = pairs;
    return {(4 * n - 2) / (n * (n + 1)) / interval, 6 / (n * (n + 1)) / interval};
}
