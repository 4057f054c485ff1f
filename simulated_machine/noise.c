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

double exponential(struct noise* noise) { return -logarithm(1 - uniform(noise)); }

/* Folded into a quarter of a turn to either side. */
double sineOfTurns(double turns)
{
    double folded = turns - floor(turns + 0.5);
    if (fabs(folded) > 0.25) folded = copysign(0.5, folded) - folded;
    const double x = 6.28318530717958647693 * folded;
    double series = 1;
    for (int power = 21; power > 1; power -= 2)
        series = 1 - series * (x * x) / (power * (power - 1));
    return x * series;
}

/* The fastest stage is set such that both deviations hold to 3 % over single numbers too. */
static double flickering(struct flicker* flicker)
{
    const double variance = 1.386294361119890619; /* ln 4 */
    double sum = 0;
    double pull = 1.4;
    for (int i = 0; i < kStages; ++i) {
        const double kept = 1 / (1 + pull);
        flicker->stages[i] = kept * flicker->stages[i] +
                             sqrt((1 - kept * kept) * variance) * normal(&flicker->noise);
        sum += flicker->stages[i];
        pull /= 4;
    }
    return sum;
}

/* By the root of 2 ln 2, and of ln(256/27) / 2. */
double flickerOfAllan(struct flicker* flicker, double ppb)
{
    return ppb == 0 ? 0 : flickering(flicker) * ppb / 1.177410022515474691;
}
double flickerOfTime(struct flicker* flicker, double ns)
{
    return ns == 0 ? 0 : flickering(flicker) * ns / 1.060504733246210770;
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
    errorNs += flickerOfTime(&model->flicker, model->flickerNs);
    errorNs -= model->delayNs * exponential(&model->delays);
    if (uniform(&model->chances) < model->delayedShare) errorNs -= model->outlierNs;
    return llround(errorNs);
}

int64_t cutStamp(const struct measurement* model, int64_t ns)
{
    const int64_t granularityNs = (int64_t)model->granularityNs;
    return granularityNs > 0 ? ns - ns % granularityNs : ns;
}

int isMissing(struct measurement* model) { return uniform(&model->misses) < model->missingShare; }
