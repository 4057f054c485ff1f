#include "maths/sameBits.h"

#include <cmath>

namespace dravikHost {

namespace {

constexpr double kLn2 = 0.693147180559945309417;
constexpr double kSqrtHalf = 0.707106781186547524401;
constexpr double kTwoPi = 6.28318530717958647693;

} // namespace

// ln(m * 2^e) = e ln 2 + 2 atanh((m - 1)/(m + 1)), with m so near to 1 that the argument stays
// below 0.172 and the terms up to the 19th power reach the last digit.
double logarithm(double value)
{
    int exponent = 0;
    double mantissa = std::frexp(value, &exponent);
    if (mantissa < kSqrtHalf) {
        mantissa *= 2;
        --exponent;
    }
    const double z = (mantissa - 1) / (mantissa + 1);
    double series = 0;
    for (int power = 19; power > 0; power -= 2)
        series = series * (z * z) + 1.0 / power;
    return exponent * kLn2 + 2 * z * series;
}

// Folded into a quarter of a turn to either side, where the terms up to the 21st power do.
double sineOfTurns(double turns)
{
    double folded = turns - std::floor(turns + 0.5);
    if (std::fabs(folded) > 0.25) folded = std::copysign(0.5, folded) - folded;
    const double x = kTwoPi * folded;
    double series = 1;
    for (int power = 21; power > 1; power -= 2)
        series = 1 - series * (x * x) / (power * (power - 1));
    return x * series;
}

double cosineOfTurns(double turns) { return sineOfTurns(turns + 0.25); }

} // namespace dravikHost
