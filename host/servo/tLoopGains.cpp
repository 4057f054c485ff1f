#include "servo/tLoopGains.h"

#include <fmt/format.h>

#include <algorithm>
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

} // namespace dravikHost
