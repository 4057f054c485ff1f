#include "metrics/masks.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <iterator>
#include <numeric>
#include <stdexcept>

namespace dravikHost {

namespace {

// Limits in ns; 0: there is none. The low-passed ones are of the error behind a filter of 0.1 Hz,
// the high-passed one of what that takes away.
struct tMask {
    const char* name;
    const char* document;
    const char* clock; // that it binds
    double largestError;
    double constantError; // mean over 1000 s
    double lowPassedError;
    double lowPassedMtie; // up to 1000 s, and at variable temperature up to 10,000 s
    double lowPassedTdev; // up to 1000 s
    double highPassedPeakToPeak;
    double tdevPerSecond; // of tau, from 0.05 s to 10 s
    double seconds;       // that the largest errors and the peak to peak are over
};
constexpr const char* kG82732 = "ITU-T G.8273.2, second edition of October 2020 with amendments 1 "
                                "(February 2022) and 2 (November 2022)";
constexpr const char* kG82733 = "ITU-T G.8273.3, second edition of October 2020";
constexpr const char* k8021as = "IEEE 802.1AS";
constexpr tMask kMasks[] = {
    {"g8273.2-a", kG82732, "class A", 100, 50, 0, 40, 4, 70, 0, 1000},
    {"g8273.2-b", kG82732, "class B", 70, 20, 0, 40, 4, 70, 0, 1000},
    {"g8273.2-c", kG82732, "class C", 30, 10, 0, 10, 2, 30, 0, 1000},
    {"g8273.2-d", kG82732, "class D", 0, 0, 5, 0, 0, 0, 0, 1000},
    {"g8273.3-a", kG82733, "class A", 100, 50, 0, 40, 4, 70, 0, 1000},
    {"g8273.3-b", kG82733, "class B", 70, 20, 0, 40, 4, 70, 0, 1000},
    {"802.1as", k8021as,
     "its TDEV (clause B.1.3.2) binds a free-running local clock, not a disciplined one", 1000, 0,
     0, 0, 0, 0, 5, 0},
};

constexpr double kCorner = 0.1;            // Hz
constexpr double kLongestInterval = 1.005; // s; one point a second, as moments may be rounded
constexpr double kLongestTau = 1000;       // s
constexpr double kLongestTauVariable = 10'000;
constexpr double kShortestTau = 0.05;
constexpr double kSlopeUpTo = 10; // s; of the limit that grows with tau
constexpr double kTausInTdev = 3; // the data that a TDEV needs

const tMask& maskOf(const std::string& name)
{
    return *std::find_if(std::begin(kMasks), std::end(kMasks),
                         [&name](const tMask& m) { return name == m.name; });
}

// What was found for a limit.
struct tFound {
    std::string text;
    bool within;
};

tFound compared(double foundNs, double limitNs)
{
    return {durationText(foundNs), foundNs <= limitNs};
}

// Whole intervals, as moments may be rounded; 0 if there is none.
size_t pointsIn(double seconds, double interval)
{
    const double points = std::min(seconds / interval, 1e9);
    return static_cast<size_t>(points + std::min(1e-3 * points, 0.25));
}

// Too little data can break a limit, but not hold it.
tMaskLine judged(const std::string& limit, const tFound& found, size_t points, double interval,
                 double neededSeconds)
{
    if (!found.within) return {limit, found.text, tMaskLine::kBroken};
    if (points >= pointsIn(neededSeconds, interval)) return {limit, found.text, tMaskLine::kHeld};
    return {limit,
            fmt::format("{}; needs {} of data, has {}", found.text,
                        durationText(nsOf(neededSeconds)),
                        durationText(nsOf(static_cast<double>(points) * interval))),
            tMaskLine::kNotJudged};
}

double largestNs(const std::vector<double>& errors)
{
    double largest = 0;
    for (const double error : errors)
        largest = std::max(largest, std::fabs(error));
    return nsOf(largest);
}

double peakToPeakNs(const std::vector<double>& errors)
{
    const auto extremes = std::minmax_element(errors.begin(), errors.end());
    return nsOf(*extremes.second - *extremes.first);
}

// Octaves, and the longest tau up to the mask's end that there is a TDEV for. MTIE never falls with
// tau, and the longest one tells.
std::vector<size_t> averagings(const tSeries& series, std::optional<double> tStability::*figure,
                               size_t longest)
{
    const size_t points = series.phase.size();
    if (figure == &tStability::mtie) return {std::min(points - 1, longest)};
    std::vector<size_t> list = octaves(series);
    list.push_back(std::min(points / 3, longest));
    return list;
}

// The largest mean over so many points, or over all if they are fewer.
double largestMeanNs(const tSeries& series, size_t points)
{
    const size_t n = std::min(points, series.phase.size());
    std::vector<double> sums = {0};
    std::partial_sum(series.phase.begin(), series.phase.end(), std::back_inserter(sums));
    double largest = 0;
    for (size_t end = n; end < sums.size(); ++end)
        largest = std::max(largest, std::fabs(sums[end] - sums[end - n]));
    return nsOf(largest / static_cast<double>(n));
}

// The largest share of its limit that a figure takes over the taus of a mask.
struct tWorst {
    double tau = 0;
    double foundNs = 0;
    double limitNs = 0;
};
template <typename Limit>
std::optional<tWorst> worstOf(const tSeries& series, std::optional<double> tStability::*figure,
                              double longestTau, Limit limitNs)
{
    const size_t longest = pointsIn(longestTau, series.interval);
    std::optional<tWorst> worst;
    for (const size_t n : averagings(series, figure, longest)) {
        const double tau = static_cast<double>(n) * series.interval;
        if (n < 1 || tau < kShortestTau || n > longest) continue;
        const auto found = stabilityAt(series, n).*figure;
        if (!found) continue;
        const tWorst here = {tau, nsOf(*found), limitNs(tau)};
        if (!worst || here.foundNs * worst->limitNs > worst->foundNs * here.limitNs) worst = here;
    }
    return worst;
}

tMaskLine judgedWorst(const std::string& limit, const std::optional<tWorst>& worst,
                      const tSeries& series, double neededSeconds)
{
    if (!worst) return {limit, "too few points", tMaskLine::kNotJudged};
    const tFound found = {
        fmt::format("{} at {}", durationText(worst->foundNs), durationText(nsOf(worst->tau))),
        worst->foundNs <= worst->limitNs};
    return judged(limit, found, series.phase.size(), series.interval, neededSeconds);
}

// Those of the error as it is.
void addUnfiltered(std::vector<tMaskLine>& lines, const tMask& mask, const tMeasured& measured)
{
    const tSeries& series = measured.series;
    if (mask.largestError > 0) {
        lines.push_back(judged(fmt::format("max |TE| {} ns", mask.largestError),
                               compared(largestNs(measured.errors), mask.largestError),
                               measured.errors.size(), series.interval, mask.seconds));
    }
    if (mask.constantError > 0) {
        const size_t wanted = std::max(pointsIn(kLongestTau, series.interval), size_t{1});
        tFound found = compared(largestMeanNs(series, wanted), mask.constantError);
        // A mean over less tells nothing of the one over all.
        found.within = found.within || series.phase.size() < wanted;
        lines.push_back(judged(fmt::format("cTE {} ns, mean over 1000 s", mask.constantError),
                               found, series.phase.size(), series.interval, kLongestTau));
    }
    if (mask.tdevPerSecond > 0) {
        const auto limitNs = [&mask](double tau) { return mask.tdevPerSecond * tau; };
        lines.push_back(
            judgedWorst(fmt::format("TDEV {} ns per s of tau up to 10 s, free-running clock",
                                    mask.tdevPerSecond),
                        worstOf(series, &tStability::tdev, kSlopeUpTo, limitNs), series,
                        kTausInTdev * kSlopeUpTo));
    }
}

void addFiltered(std::vector<tMaskLine>& lines, const tMask& mask, const tSeries& series)
{
    const bool canFilter = series.interval <= kLongestInterval;
    const tSeries low = lowPass(series, kCorner);
    const auto add = [&](const char* title, double limitNs, const char* condition, auto judge) {
        if (limitNs <= 0) return;
        const std::string limit = fmt::format("{} {} ns{}", title, limitNs, condition);
        lines.push_back(canFilter ? judge(limit, limitNs)
                                  : tMaskLine{limit, "pairs too far apart for a filter of 0.1 Hz",
                                              tMaskLine::kNotJudged});
    };
    const auto single = [&](double foundNs) {
        return [&, foundNs](const std::string& limit, double limitNs) {
            return judged(limit, compared(foundNs, limitNs), series.phase.size(), series.interval,
                          mask.seconds);
        };
    };
    const auto overTau = [&](std::optional<double> tStability::*figure, double longestTau,
                             double neededSeconds) {
        return [=, &low](const std::string& limit, double limitNs) {
            const auto worst =
                worstOf(low, figure, longestTau, [limitNs](double /*tau*/) { return limitNs; });
            return judgedWorst(limit, worst, low, neededSeconds);
        };
    };
    add("max |TE_L|", mask.lowPassedError, "", single(largestNs(low.phase)));
    add("dTE_L MTIE up to 1000 s", mask.lowPassedMtie, ", constant temperature",
        overTau(&tStability::mtie, kLongestTau, kLongestTau));
    add("dTE_L MTIE up to 10000 s", mask.lowPassedMtie, ", variable temperature",
        overTau(&tStability::mtie, kLongestTauVariable, kLongestTauVariable));
    add("dTE_L TDEV up to 1000 s", mask.lowPassedTdev, ", constant temperature",
        overTau(&tStability::tdev, kLongestTau, kTausInTdev * kLongestTau));
    add("dTE_H peak to peak", mask.highPassedPeakToPeak, ", constant temperature",
        single(peakToPeakNs(highPass(series, kCorner).phase)));
}

} // namespace

const std::vector<std::string>& maskNames()
{
    static const std::vector<std::string> names = [] {
        std::vector<std::string> list;
        for (const tMask& mask : kMasks)
            list.emplace_back(mask.name);
        return list;
    }();
    return names;
}

std::string maskTitle(const std::string& name)
{
    const tMask& mask = maskOf(name);
    return fmt::format("{}; {}", mask.document, mask.clock);
}

std::vector<tMaskCurve> maskCurves(const std::string& name)
{
    const tMask& mask = maskOf(name);
    std::vector<tMaskCurve> curves;
    if (mask.lowPassedMtie > 0) {
        curves.push_back({"MTIE", &tStability::mtie, true, kShortestTau, kLongestTauVariable,
                          mask.lowPassedMtie, mask.lowPassedMtie});
    }
    if (mask.lowPassedTdev > 0) {
        curves.push_back({"TDEV", &tStability::tdev, true, kShortestTau, kLongestTau,
                          mask.lowPassedTdev, mask.lowPassedTdev});
    }
    if (mask.tdevPerSecond > 0) {
        curves.push_back({"TDEV, free-running clock", &tStability::tdev, false, kShortestTau,
                          kSlopeUpTo, mask.tdevPerSecond * kShortestTau,
                          mask.tdevPerSecond * kSlopeUpTo});
    }
    return curves;
}

tSeries behindMaskFilter(const tSeries& series)
{
    if (series.interval > kLongestInterval)
        throw std::runtime_error("pairs are too far apart for the mask's filter of 0.1 Hz");
    return lowPass(series, kCorner);
}

std::vector<tMaskLine> checkMask(const std::string& name, const tMeasured& measured)
{
    const tMask& mask = maskOf(name);
    std::vector<tMaskLine> lines;
    if (measured.series.phase.size() < 2)
        return {{"all limits", "too few points", tMaskLine::kNotJudged}};
    addUnfiltered(lines, mask, measured);
    addFiltered(lines, mask, measured.series);
    return lines;
}

} // namespace dravikHost
