#include "design/tLoopAnalysis.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>

namespace dravikHost {

namespace {

using tPole = std::complex<double>;

struct tPoles {
    tPole one, other;
};

tPoles polesOf(double sum, double product)
{
    const tPole root = std::sqrt(tPole(sum * sum / 4 - product, 0));
    return {sum / 2 + root, sum / 2 - root};
}

// Poles on the negative axis alternate from pair to pair, which no damping describes.
std::optional<double> dampingOf(const tPoles& poles)
{
    const auto decays = [](const tPole& z) { return z.imag() != 0 || z.real() > 0; };
    if (!decays(poles.one) || !decays(poles.other)) return std::nullopt;
    const tPole one = std::log(poles.one);
    const tPole other = std::log(poles.other);
    return -(one + other).real() / (2 * std::sqrt((one * other).real()));
}

// The loop at work, in phases of one.
class tLoop
{
public:
    tLoop(const tServoParameters& parameters, double interval, double firstPhase)
        : law(parameters), t(interval), x(firstPhase)
    {}

    // The phase as it is, before the law sees it with that much noise.
    double next(double noise)
    {
        const double seen = x + noise;
        const double before = x;
        u = law.phaseLockCoefficientC * u - law.phaseLockGain * (law.phaseLockCoefficientA * seen -
                                                                 law.phaseLockCoefficientB * last);
        last = seen;
        x += t * u;
        return before;
    }

private:
    const tServoParameters& law;
    double t;
    double x;
    double u = 0;
    double last = 0;
};

} // namespace

tLoopAnalysis::tLoopAnalysis(const tServoParameters& parameters, double interval)
    : stable(false), stableBelow(0)
{
    constexpr double kSettled = 0.01;
    constexpr double kLeastPairs = 2; // of a loop with both poles at 0
    constexpr double kMostPairs = 1e6;
    const double g = parameters.phaseLockGain;
    const double a = parameters.phaseLockCoefficientA;
    const double b = parameters.phaseLockCoefficientB;
    const double c = parameters.phaseLockCoefficientC;
    const double sum = 1 + c - g * a * interval;
    const double product = c - g * b * interval;
    stable = std::fabs(product) < 1 && std::fabs(sum) < 1 + product;
    if (c == 1 && a > b && a + b > 0)
        stableBelow = b > 0 ? std::min(4 / (g * (a + b)), 2 / (g * b)) : 0;
    if (!stable) return;

    const tPoles poles = polesOf(sum, product);
    damping = dampingOf(poles);
    const double radius = std::max(std::abs(poles.one), std::abs(poles.other));
    const double pairs = std::clamp(std::log(kSettled) / std::log(radius), kLeastPairs, kMostPairs);
    settling = pairs * interval;
    tLoop step(parameters, interval, 1);
    tLoop impulse(parameters, interval, 0);
    double squares = 0;
    const auto enough = static_cast<int64_t>(4 * pairs) + 2;
    for (int64_t pair = 0; pair < enough; ++pair) { // to a part in 10^8
        overshoot = std::max(overshoot, -step.next(0));
        const double phase = impulse.next(pair == 0 ? 1 : 0);
        squares += phase * phase;
    }
    noiseGain = std::sqrt(squares);
}

} // namespace dravikHost
