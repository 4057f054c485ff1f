/* Nothing here depends on the C library's last digits. */
#include "machine.h"

#include <math.h>

/* ln(m * 2^e) = e ln 2 + 2 atanh((m - 1)/(m + 1)), m between the root of a half and that of two. */
static double logarithm(double value)
{
    int exponent = 0;
    double mantissa = frexp(value, &exponent);
    if (mantissa < 0.707106781186547524401) {
        mantissa *= 2;
        --exponent;
    }
    const double z = (mantissa - 1) / (mantissa + 1);
    double series = 0;
    for (int power = 19; power > 0; power -= 2)
        series = series * (z * z) + 1.0 / power;
    return exponent * 0.693147180559945309417 + 2 * z * series;
}

/* SplitMix64. */
double uniform(struct noise* noise)
{
    noise->state += 0x9e3779b97f4a7c15;
    uint64_t mixed = noise->state;
    mixed = (mixed ^ mixed >> 30) * 0xbf58476d1ce4e5b9;
    mixed = (mixed ^ mixed >> 27) * 0x94d049bb133111eb;
    return (double)((mixed ^ mixed >> 31) >> 11) * 0x1p-53;
}

/* The polar method: a point within the unit circle gives two values. */
double normal(struct noise* noise)
{
    if (noise->hasSpare) {
        noise->hasSpare = 0;
        return noise->spare;
    }
    double x = 0;
    double y = 0;
    double square = 0;
    while (square >= 1 || square == 0) {
        x = 2 * uniform(noise) - 1;
        y = 2 * uniform(noise) - 1;
        square = x * x + y * y;
    }
    const double factor = sqrt(-2 * logarithm(square) / square);
    noise->spare = y * factor;
    noise->hasSpare = 1;
    return x * factor;
}

/* Numbers are drawn at level 0 too: one kind of error does not change another. */
int64_t measurementErrorNs(struct measurement* model)
{
    double errorNs = model->deviationNs * normal(&model->noise);
    const double chance = uniform(&model->noise);
    if (chance < model->outlierShare)
        errorNs += chance < model->outlierShare / 2 ? -model->outlierNs : model->outlierNs;
    if (model->errorsNs.count > 0)
        errorNs += model->errorsNs.values[model->next++ % model->errorsNs.count];
    return llround(errorNs);
}
