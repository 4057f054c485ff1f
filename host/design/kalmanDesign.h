#pragma once

#include "design/tNoiseModel.h"
#include "servo/tLoopGains.h"

namespace dravikHost {

// A two-state Kalman filter of phase x and frequency y, closed into a loop that takes the whole
// estimate back with each pair. With its gains K1 and K2 and the measured phase x,
//
//     u(n) - u(n-1) = -(K1/T + K2) x(n) + K1/T x(n-1)
//
// which is a proportional-integral controller with kp = K1 / T and ki = K2.
struct tKalmanDesign {
    tLoopGains gains;
    double rmsNs; // of the clock at the moment of a measurement, as the theory has it
};

// In the steady state of that noise: no linear loop has less error.
tKalmanDesign steadyKalman(const tNoiseModel& model);

// Of a filter that has seen so many pairs of a clock that does not wander: the larger the count,
// the slower and the quieter the loop.
tLoopGains growingKalman(double pairs, double interval);

} // namespace dravikHost
