#include "selftune/tDoubtfulPairs.h"

#include <algorithm>
#include <cmath>

namespace dravikHost {

void tDoubtfulPairs::takeGood(const tPoint& point)
{
    add(point, false);
    inRow = 0;
}

// The longer it lasts without an explanation, the more of the latest points have to agree on one,
// as some few of many will always lie on a line.
tDoubtfulPairs::tVerdict tDoubtfulPairs::takeDoubtful(const tPoint& point, double noiseVariance)
{
    constexpr size_t kLevel = 4;
    constexpr size_t kSloping = 5;
    add(point, true);
    ++inRow;
    const size_t half = std::min((inRow + 1) / 2, kKept);
    if (inRow >= kLevel) {
        const tVerdict verdict = line(std::max(kLevel, half), false, noiseVariance);
        if (verdict.finding != kNothing) return verdict;
    }
    if (inRow >= kSloping) {
        const tVerdict verdict = line(std::max(kSloping, half), true, noiseVariance);
        if (verdict.finding != kNothing) return verdict;
    }
    return grownNoise();
}

void tDoubtfulPairs::forget() { count = inRow = 0; }

void tDoubtfulPairs::add(const tPoint& point, bool doubtful)
{
    entries[count++ % kKept] = {point, doubtful};
}

// The line through the latest points, if they are no farther from it than the noise makes them:
// the sum of squares within three deviations of what it should be, and a little.
tDoubtfulPairs::tVerdict tDoubtfulPairs::line(size_t points, bool sloping,
                                              double noiseVariance) const
{
    const double n = static_cast<double>(points);
    const double now = latest(0).point.seconds;
    double t = 0, x = 0, tt = 0, tx = 0;
    for (size_t i = 0; i < points; ++i) {
        const tPoint& each = latest(i).point;
        const double ago = each.seconds - now;
        t += ago;
        x += each.innovationNs;
        tt += ago * ago;
        tx += ago * each.innovationNs;
    }
    const double spread = n * tt - t * t;
    const double slope = sloping ? (n * tx - t * x) / spread : 0;
    const double phase = (x - slope * t) / n;
    double squares = 0;
    for (size_t i = 0; i < points; ++i) {
        const tPoint& each = latest(i).point;
        const double off = each.innovationNs - phase - slope * (each.seconds - now);
        squares += off * off;
    }
    const double freedom = n - (sloping ? 2 : 1);
    if (!(squares < noiseVariance * (freedom + 3 * std::sqrt(2 * freedom) + 3))) return {};
    if (!sloping) return {kJump, phase, 0, 0, 0};
    return {kNewFrequency, phase, slope, noiseVariance * n / spread, 0};
}

// Half of the latest points are doubtful, and to both sides; or it goes on for so long that it has
// to be believed.
tDoubtfulPairs::tVerdict tDoubtfulPairs::grownNoise() const
{
    constexpr size_t kWindow = 12;
    constexpr size_t kTooLong = 100;
    const size_t points = std::min({count, std::max(kWindow, inRow / 2 + 3), kKept});
    size_t doubtful = 0, above = 0;
    double sum = 0;
    for (size_t i = 0; i < points; ++i) {
        const tEntry& entry = latest(i);
        if (!entry.doubtful) continue;
        ++doubtful;
        above += entry.point.innovationNs > 0 ? 1 : 0;
        sum += entry.point.innovationNs;
    }
    const size_t fewer = std::min(above, doubtful - above);
    const bool bothSides = doubtful * 2 >= kWindow && fewer * 4 >= doubtful;
    if (inRow < kTooLong && !bothSides) return {};
    const double phase = inRow < kTooLong ? 0 : sum / static_cast<double>(doubtful);
    const double deviation = scatter(points);
    return {kNoise, phase, 0, 0, deviation * deviation};
}

// Of points of which the greater part may be far off: the median of their sizes, which of a normal
// distribution is 0.6745 deviations.
double tDoubtfulPairs::scatter(size_t points) const
{
    std::array<double, kKept> sizes{};
    for (size_t i = 0; i < points; ++i)
        sizes[i] = std::fabs(latest(i).point.innovationNs);
    const auto middle = sizes.begin() + static_cast<std::ptrdiff_t>(points / 2);
    std::nth_element(sizes.begin(), middle, sizes.begin() + static_cast<std::ptrdiff_t>(points));
    return *middle / 0.6745;
}

} // namespace dravikHost
