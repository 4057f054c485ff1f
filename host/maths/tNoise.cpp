#include "maths/tNoise.h"

#include <cmath>

namespace dravikHost {

namespace {

constexpr double kLn2 = 0.693147180559945309417;
constexpr double kSqrtHalf = 0.707106781186547524401;

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

} // namespace

double tNoise::uniform() { return static_cast<double>(engine() >> 11) * 0x1p-53; }

// The polar method: a point within the unit circle gives two values.
double tNoise::normal()
{
    if (hasSpare) {
        hasSpare = false;
        return spare;
    }
    double x = 0;
    double y = 0;
    double square = 0;
    do {
        x = 2 * uniform() - 1;
        y = 2 * uniform() - 1;
        square = x * x + y * y;
    } while (square >= 1 || square == 0);
    const double factor = std::sqrt(-2 * logarithm(square) / square);
    spare = y * factor;
    hasSpare = true;
    return x * factor;
}

} // namespace dravikHost
