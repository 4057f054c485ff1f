#include "selftune/tDoubtfulPairs.h"

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

constexpr double kMemory = 200; // pairs

// Whether so many squares add up to what noise makes of them: two deviations more, and a little.
bool isNoise(double squares, double freedom, double noiseVariance)
{
    return squares < noiseVariance * (freedom + 2 * std::sqrt(2 * freedom) + 1);
}

} // namespace

void tDoubtfulPairs::takeGood(const tPoint& point)
{
    add(point, false);
    inRow = 0;
    goodSeconds = point.seconds;
}

// All pairs of a jump agree from the start. Later, of what began otherwise, half of all have to, as
// some few of many will always do.
tDoubtfulPairs::tVerdict tDoubtfulPairs::takeDoubtful(const tPoint& point, double noiseVariance)
{
    constexpr size_t kSloping = 5;
    constexpr size_t kAfterOthers = 6;
    constexpr size_t kForLine = 8;
    const size_t forJump = pointsOfJump();
    const bool otherSide =
        inRow > 0 && (latest(0).point.innovationNs > 0) != (point.innovationNs > 0);
    add(point, true);
    inRow = otherSide ? 1 : inRow + 1;
    const size_t points = inRow <= forJump
                              ? forJump
                              : std::max({forJump, kAfterOthers, std::min((inRow + 1) / 2, kKept)});
    if (inRow >= points) {
        const tVerdict verdict = level(points, noiseVariance);
        if (verdict.finding != kNothing) return verdict;
    }
    if (inRow >= std::max(kSloping, forJump) && inRow <= kKept) {
        const tVerdict verdict = line(inRow, noiseVariance);
        if (verdict.finding != kNothing && beginsAtLastGood(verdict, noiseVariance)) return verdict;
    }
    const size_t forLine = std::max(kForLine, points);
    if (inRow >= forLine) {
        const tVerdict verdict = line(forLine, noiseVariance);
        if (verdict.finding != kNothing) return verdict;
    }
    return grownNoise();
}

// Where outliers are frequent, more of them come in a row by chance.
size_t tDoubtfulPairs::pointsOfJump() const
{
    constexpr size_t kLeast = 4;
    constexpr size_t kMost = 10;
    constexpr double kSeldom = 1e-5;
    size_t points = kLeast;
    double chance = share * share * share * share;
    for (; points < kMost && chance > kSeldom; ++points)
        chance *= share;
    return points;
}

void tDoubtfulPairs::forget() { count = inRow = 0; }

void tDoubtfulPairs::add(const tPoint& point, bool doubtful)
{
    entries[count++ % kKept] = {point, doubtful};
    share += ((doubtful ? 1 : 0) - share) / kMemory;
}

tDoubtfulPairs::tVerdict tDoubtfulPairs::level(size_t points, double noiseVariance) const
{
    const auto n = static_cast<double>(points);
    double sum = 0;
    for (size_t i = 0; i < points; ++i)
        sum += latest(i).point.innovationNs;
    const double phase = sum / n;
    double squares = 0;
    for (size_t i = 0; i < points; ++i) {
        const double off = latest(i).point.innovationNs - phase;
        squares += off * off;
    }
    if (!isNoise(squares, n - 1, noiseVariance)) return {};
    return {kJump, phase, 0, 0, 0};
}

// Whether the clock was about where it was foreseen when that was last so: its phase does not jump.
bool tDoubtfulPairs::beginsAtLastGood(const tVerdict& verdict, double noiseVariance) const
{
    constexpr double kAbout = 6; // deviations
    const double passed = latest(0).point.seconds - goodSeconds;
    const double then = verdict.phaseNs - verdict.frequencyPpb * passed;
    return then * then < kAbout * kAbout * noiseVariance;
}

// Any line. If it begins elsewhere, something wrong was believed before.
tDoubtfulPairs::tVerdict tDoubtfulPairs::line(size_t points, double noiseVariance) const
{
    const auto n = static_cast<double>(points);
    const double now = latest(0).point.seconds;
    double t = 0;
    double x = 0;
    double tt = 0;
    double tx = 0;
    for (size_t i = 0; i < points; ++i) {
        const tPoint& each = latest(i).point;
        const double ago = each.seconds - now;
        t += ago;
        x += each.innovationNs;
        tt += ago * ago;
        tx += ago * each.innovationNs;
    }
    const double spread = n * tt - t * t;
    const double slope = (n * tx - t * x) / spread;
    const double phase = (x - slope * t) / n;
    double squares = 0;
    for (size_t i = 0; i < points; ++i) {
        const tPoint& each = latest(i).point;
        const double off = each.innovationNs - phase - slope * (each.seconds - now);
        squares += off * off;
    }
    if (!isNoise(squares, n - 2, noiseVariance)) return {};
    return {kNewFrequency, phase, slope, noiseVariance * n / spread, 0};
}

// Half of the latest points are doubtful, and to both sides; or it goes on for so long that it has
// to be believed.
tDoubtfulPairs::tVerdict tDoubtfulPairs::grownNoise() const
{
    constexpr size_t kWindow = 12;
    constexpr size_t kTooLong = 100;
    const size_t points = std::min({count, std::max(kWindow, inRow / 2 + 3), kKept});
    size_t doubtful = 0;
    size_t above = 0;
    size_t changes = 0; // of the side
    bool wasAbove = false;
    double sum = 0;
    for (size_t i = 0; i < points; ++i) {
        const tEntry& entry = latest(i);
        if (!entry.doubtful) continue;
        const bool isAbove = entry.point.innovationNs > 0;
        changes += doubtful > 0 && isAbove != wasAbove ? 1 : 0;
        wasAbove = isAbove;
        above += isAbove ? 1 : 0;
        ++doubtful;
        sum += entry.point.innovationNs;
    }
    const size_t fewer = std::min(above, doubtful - above);
    const bool bothSides = doubtful * 2 >= kWindow && fewer * 4 >= doubtful && changes > 1;
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
