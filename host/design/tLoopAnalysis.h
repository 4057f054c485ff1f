#pragma once

#include "servo/tServoParameters.h"

#include <optional>

namespace dravikHost {

// The closed loop of the law at an interval of T seconds, the spike filter apart. With phase x and
// frequency offset u,
//
//     x(n+1) = x(n) + T u(n)
//     u(n+1) = C u(n) - g (A x(n+1) - B x(n))
//
// whose poles are those of z^2 - (1 + C - g A T) z + (C - g B T).
struct tLoopAnalysis {
    tLoopAnalysis(const tServoParameters& parameters, double interval);

    bool stable;
    bool marginal = false; // a pole at 1, the other one inside: no integral part
    double stableBelow;    // s; the interval from which on it is not; 0: at none, or C is not 1

    // Of a stable loop.
    std::optional<double> damping; // none if its poles are no decaying oscillation or slope
    double settling = 0;           // s, to one per cent
    double overshoot = 0;          // of a step in phase: share by which it goes beyond
    double noiseGain = 0;          // deviation of the clock per deviation of white measurements
    double takeUp = 0;             // s; how far a wrong frequency at the lock leads it astray

    // Of the clock, for a walk in steps per pair: of its phase, and of its frequency.
    double phaseWalkGain = 0;     // ns per ns
    double frequencyWalkGain = 0; // s; ns per ppb

    // From the phase of the reference to that of the clock.
    double bandwidth = 0; // Hz, where it is down by 3 dB; 0: nowhere below half the rate of pairs
    double peaking = 0;   // dB
};

// The same, at once; in dB, of a loop that is stable.
double gainPeaking(const tServoParameters& parameters, double interval);

} // namespace dravikHost
