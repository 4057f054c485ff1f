#pragma once

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

} // namespace dravikHost
