#include "design/bandwidthDesign.h"

#include "design/tLoopAnalysis.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <cmath>
#include <stdexcept>

namespace dravikHost {

namespace {

constexpr double kPi = 3.14159265358979323846;

// With K1 = kp T, r = ki / kp and y = 1 - cos w, half the power passes at the angle w from pair to
// pair where
//
//     (r^2 + 2 (1 + r) y) K1^2 + 4 y (r + y) K1 - 4 y^2 = 0
tLoopGains withHalfPowerAt(double y, double r, double interval)
{
    const double square = r * r + 2 * (1 + r) * y;
    const double k1 = 2 * y / (r + y + std::sqrt((r + y) * (r + y) + square));
    return {k1 / interval, k1 * r / interval};
}

bool holds(const tLoopGains& gains, double peaking, double interval)
{
    const double k1 = gains.kp * interval;
    const double k2 = gains.ki * interval;
    if (k2 > k1 * k1 / 2) return false; // damping of 0.7
    tServoParameters law;
    law.phaseLockGain = gains.kp;
    law.phaseLockCoefficientA = 1 + gains.ki / gains.kp;
    return gainPeaking(law, interval) <= peaking;
}

} // namespace

// Peaking grows with r.
tLoopGains gainsForBandwidth(double bandwidth, double peaking, double interval)
{
    constexpr int kHalvings = 60;
    constexpr double kRounding = 0.999; // digits that the document has not
    constexpr double kLeastPart = 1e-8; // of A, which has 12 digits
    if (!(bandwidth < 0.5 / interval)) {
        throw std::runtime_error(fmt::format("no loop with a pair every {} has a bandwidth of "
                                             "{:.4g} Hz: it has to be below half the "
                                             "rate of pairs, {:.4g} Hz",
                                             durationText(nsOf(interval)), bandwidth,
                                             0.5 / interval));
    }
    const double half = std::sin(kPi * bandwidth * interval);
    const double y = 2 * half * half;
    double low = 0;
    double high = 1;
    for (int i = 0; i < kHalvings; ++i) {
        const double r = (low + high) / 2;
        (holds(withHalfPowerAt(y, r, interval), kRounding * peaking, interval) ? low : high) = r;
    }
    if (low < kLeastPart) {
        throw std::runtime_error(
            fmt::format("no document has the digits for {:.4g} dB of peaking at "
                        "{:.4g} Hz: A would be above B by {:.1g} of it",
                        peaking, bandwidth, low));
    }
    return withHalfPowerAt(y, low, interval);
}

} // namespace dravikHost
