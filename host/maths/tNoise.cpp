#include "maths/tNoise.h"

#include "maths/sameBits.h"

#include <cmath>

namespace dravikHost {

namespace {

constexpr uint64_t kFarApart = 0x9e3779b97f4a7c15;

} // namespace

tNoise::tNoise(uint64_t seed, uint64_t cause) : engine(seed + cause * kFarApart) {}

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

double tNoise::exponential() { return -logarithm(1 - uniform()); }

} // namespace dravikHost
