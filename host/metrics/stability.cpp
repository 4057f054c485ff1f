#include "metrics/stability.h"

#include <algorithm>
#include <cmath>
#include <deque>
#include <numeric>

namespace dravikHost {

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

namespace {

// Of its points within the first second, both ends included.
double meanOfFirstSecond(const tSeries& series)
{
    const auto& x = series.phase;
    constexpr double kRounded = 0.01; // of the moments
    const double wanted = std::floor(1 / series.interval + kRounded) + 1;
    const auto last = std::min(static_cast<double>(x.size()), wanted);
    return std::accumulate(x.begin(), x.begin() + static_cast<std::ptrdiff_t>(last), 0.0) / last;
}

} // namespace

tSeries lowPass(const tSeries& series, double corner)
{
    constexpr double kTwoPi = 6.283185307179586;
    const double share = 1 - std::exp(-kTwoPi * corner * series.interval);
    tSeries result = series;
    if (!series.phase.empty()) result.phase.front() = meanOfFirstSecond(series);
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

namespace {

double secondDifference(const std::vector<double>& x, size_t i, size_t n)
{
    return x[i + 2 * n] - 2 * x[i + n] + x[i];
}

std::optional<double> allan(const tSeries& series, size_t n, size_t stride)
{
    const auto& x = series.phase;
    if (x.size() < 2 * n + 1) return std::nullopt;
    double squares = 0;
    double count = 0;
    for (size_t i = 0; i + 2 * n < x.size(); i += stride) {
        const double difference = secondDifference(x, i, n);
        squares += difference * difference;
        ++count;
    }
    const double tau = static_cast<double>(n) * series.interval;
    return std::sqrt(squares / (2 * tau * tau * count));
}

// The sum over n second differences moves on from point to point.
std::optional<double> modifiedAllan(const tSeries& series, size_t n)
{
    const auto& x = series.phase;
    if (x.size() < 3 * n) return std::nullopt;
    double sum = 0;
    for (size_t i = 0; i < n; ++i)
        sum += secondDifference(x, i, n);
    double squares = sum * sum;
    double count = 1;
    for (size_t j = 0; j + 3 * n < x.size(); ++j) {
        sum += secondDifference(x, j + n, n) - secondDifference(x, j, n);
        squares += sum * sum;
        ++count;
    }
    const auto averaged = static_cast<double>(n);
    const double tau = averaged * series.interval;
    return std::sqrt(squares / (2 * averaged * averaged * tau * tau * count));
}

// The extremes of the window, each with its index: values that a later one outdoes are dropped.
template <typename Outdoes> class tExtreme
{
public:
    explicit tExtreme(const std::vector<double>& values) : x(values) {}

    double take(size_t i, size_t first)
    {
        while (!kept.empty() && !Outdoes()(x[kept.back()], x[i]))
            kept.pop_back();
        kept.push_back(i);
        while (kept.front() < first)
            kept.pop_front();
        return x[kept.front()];
    }

private:
    const std::vector<double>& x;
    std::deque<size_t> kept;
};

std::optional<double> mtieAt(const std::vector<double>& x, size_t n)
{
    if (x.size() < n + 1) return std::nullopt;
    tExtreme<std::greater<>> highest(x);
    tExtreme<std::less<>> lowest(x);
    double widest = 0;
    for (size_t i = 0; i < x.size(); ++i) {
        const size_t first = i < n ? 0 : i - n;
        widest = std::max(widest, highest.take(i, first) - lowest.take(i, first));
    }
    return widest;
}

} // namespace

tStability stabilityAt(const tSeries& series, size_t n)
{
    tStability result;
    result.adev = allan(series, n, n);
    result.oadev = allan(series, n, 1);
    result.mdev = modifiedAllan(series, n);
    if (result.mdev)
        result.tdev = *result.mdev * static_cast<double>(n) * series.interval / std::sqrt(3.0);
    result.mtie = mtieAt(series.phase, n);
    return result;
}

size_t largestAveraging(const tSeries& series)
{
    return series.phase.empty() ? 0 : (series.phase.size() - 1) / 2;
}

std::vector<size_t> octaves(const tSeries& series)
{
    std::vector<size_t> list;
    for (size_t n = 1; n <= largestAveraging(series); n *= 2)
        list.push_back(n);
    return list;
}

} // namespace dravikHost
