#include "metrics/tSeries.h"

#include <cmath>

tSeries phaseOf(const tSeries& frequency)
{
    tSeries series{frequency.interval, {0}};
    series.phase.reserve(frequency.phase.size() + 1);
    for (const double value : frequency.phase)
        series.phase.push_back(series.phase.back() + value * frequency.interval);
    return series;
}

tSeries withoutSlope(const tSeries& series)
{
    tSeries result = series;
    if (series.phase.size() < 2) return result;
    const double slope =
        (series.phase.back() - series.phase.front()) / static_cast<double>(series.phase.size() - 1);
    for (size_t i = 0; i < result.phase.size(); ++i)
        result.phase[i] -= slope * static_cast<double>(i);
    return result;
}

tSeries lowPass(const tSeries& series, double corner)
{
    constexpr double kTwoPi = 6.283185307179586;
    const double share = 1 - std::exp(-kTwoPi * corner * series.interval);
    tSeries result = series;
    for (size_t i = 1; i < result.phase.size(); ++i)
        result.phase[i] = result.phase[i - 1] + share * (series.phase[i] - result.phase[i - 1]);
    return result;
}

tSeries highPass(const tSeries& series, double corner)
{
    tSeries result = lowPass(series, corner);
    for (size_t i = 0; i < result.phase.size(); ++i)
        result.phase[i] = series.phase[i] - result.phase[i];
    return result;
}
