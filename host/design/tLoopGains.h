#pragma once

#include "design/tNoiseModel.h"
#include "servo/tServoParameters.h"

namespace dravikHost {

// A proportional-integral controller: of the errors e, in seconds, it makes the frequency offset
// u(n) = kp e(n) + ki (e(1) + ... + e(n)), a fraction, per pair.
struct tLoopGains {
    double kp; // 1/s
    double ki; // 1/s, per pair

    // Sets the law's gain and coefficients. Throws std::runtime_error if their bounds are too
    // tight.
    void putInto(tServoParameters& parameters) const;
    bool fit() const; // whether a document can have them

    // Of a law whose coefficient C is 1.
    static tLoopGains of(const tServoParameters& parameters);
};

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
