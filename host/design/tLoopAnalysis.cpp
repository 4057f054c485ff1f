#include "design/tLoopAnalysis.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <limits>

namespace dravikHost {

namespace {

constexpr double kTurn = 6.283185307179586; // rad

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
    tLoop(const tServoParameters& parameters, double interval, double firstPhase,
          double firstFrequency = 0)
        : law(parameters), t(interval), x(firstPhase), u(firstFrequency)
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
    double u;
    double last = 0;
};

// With y = 1 - cos w, w the angle between pairs, the power that passes is a ratio of polynomials
//
//     (k^2 + n y) / (k^2 + d y + e y^2)        k = a - b,  a = g A T,  b = g B T
//
// whose terms stay exact for the slowest of loops, where those in z cancel out.
class tTransfer
{
public:
    tTransfer(const tServoParameters& law, double interval)
    {
        const double a = law.phaseLockGain * law.phaseLockCoefficientA * interval;
        const double b = law.phaseLockGain * law.phaseLockCoefficientB * interval;
        const double c = law.phaseLockCoefficientC;
        kk = (a - b) * (a - b);
        n = 2 * a * b;
        d = 2 * (1 - c) * (1 - c) - 2 * (1 + c) * (a + b) + 2 * a * b + 8 * b;
        e = 4 * (c - b);
    }

    // The angle of half the power, 0 if it is beyond half a turn.
    double halfPowerAngle() const
    {
        const double y = firstRoot(e, d - 2 * n, -kk);
        return y <= kHalfTurn ? 2 * std::asin(std::sqrt(y / 2)) : 0;
    }

    double largestPower() const
    {
        const double top = firstRoot(n * e, 2 * e * kk, -kk * (n - d));
        return std::max({1.0, power(kHalfTurn), top <= kHalfTurn ? power(top) : 1.0});
    }

private:
    static constexpr double kHalfTurn = 2; // y at half the rate of pairs

    double power(double y) const { return (kk + n * y) / (kk + y * (d + e * y)); }

    // The least positive root of p y^2 + q y + r; infinity if there is none.
    static double firstRoot(double p, double q, double r)
    {
        double least = std::numeric_limits<double>::infinity();
        const double half = -(q + std::copysign(std::sqrt(q * q - 4 * p * r), q)) / 2;
        const auto look = [&least](double dividend, double divisor) {
            const double root = divisor != 0 ? dividend / divisor : 0;
            if (root > 0 && root < least) least = root;
        };
        look(half, p);
        look(r, half);
        return least;
    }

    double kk, n, d, e;
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
    marginal = c == 1 && a == b && product > -1 && product < 1;
    if (marginal) stable = false; // whatever the last digit of its sum
    if (!stable) return;

    const tPoles poles = polesOf(sum, product);
    damping = dampingOf(poles);
    const double radius = std::max(std::abs(poles.one), std::abs(poles.other));
    const double pairs = std::clamp(std::log(kSettled) / std::log(radius), kLeastPairs, kMostPairs);
    settling = pairs * interval;
    tLoop step(parameters, interval, 1);
    tLoop impulse(parameters, interval, 0);
    tLoop frequency(parameters, interval, interval, 1);
    double squares = 0;
    double phaseSquares = 0;
    double frequencySquares = 0;
    const auto enough = static_cast<int64_t>(4 * pairs) + 2;
    for (int64_t pair = 0; pair < enough; ++pair) { // to a part in 10^8
        const double stepped = step.next(0);
        const double astray = frequency.next(0);
        overshoot = std::max(overshoot, -stepped);
        takeUp = std::max(takeUp, std::fabs(astray));
        phaseSquares += stepped * stepped;
        frequencySquares += astray * astray;
        const double phase = impulse.next(pair == 0 ? 1 : 0);
        squares += phase * phase;
    }
    noiseGain = std::sqrt(squares);
    phaseWalkGain = std::sqrt(phaseSquares);
    frequencyWalkGain = std::sqrt(frequencySquares);
    bandwidth = tTransfer(parameters, interval).halfPowerAngle() / (kTurn * interval);
    peaking = gainPeaking(parameters, interval);
}

double gainPeaking(const tServoParameters& parameters, double interval)
{
    return 10 * std::log10(tTransfer(parameters, interval).largestPower());
}

} // namespace dravikHost
