#include "metrics/masks.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <numeric>
#include <stdexcept>

namespace dravikHost {

namespace {

// Limits in ns; 0: there is none. The low-passed ones are of the error behind a filter of 0.1 Hz,
// the high-passed one of what that takes away.
struct tMask {
    const char* name;
    double largestError;
    double constantError; // mean over 1000 s
    double lowPassedError;
    double lowPassedMtie; // up to 1000 s
    double lowPassedTdev; // up to 1000 s
    double highPassedPeakToPeak;
    double tdevPerSecond; // of tau, from 0.05 s to 10 s
};
constexpr tMask kMasks[] = {
    {"g8273.2-a", 100, 50, 0, 40, 4, 70, 0}, {"g8273.2-b", 70, 20, 0, 40, 4, 70, 0},
    {"g8273.2-c", 30, 10, 0, 10, 2, 0, 0},   {"g8273.2-d", 0, 0, 5, 0, 0, 0, 0},
    {"802.1as", 1000, 0, 0, 0, 0, 0, 5},
};

constexpr double kCorner = 0.1;        // Hz
constexpr double kLongestInterval = 1; // s; a filter of that corner needs some points in its time
constexpr double kLongestTau = 1000;   // s
constexpr double kShortestTau = 0.05;
constexpr double kSlopeUpTo = 10; // s; of the limit that grows with tau

const tMask& maskOf(const std::string& name)
{
    return *std::find_if(std::begin(kMasks), std::end(kMasks),
                         [&name](const tMask& m) { return name == m.name; });
}

tMaskLine compared(std::string limit, double foundNs, double limitNs)
{
    return {std::move(limit), durationText(foundNs),
            foundNs <= limitNs ? tMaskLine::kHeld : tMaskLine::kBroken};
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

// Octaves, and the longest tau up to the mask's end that a figure may be told for.
std::vector<size_t> averagingsUpTo(const tSeries& series, double longestTau)
{
    std::vector<size_t> list = octaves(series);
    const size_t points = series.phase.size();
    const auto last = static_cast<size_t>(std::min(longestTau / series.interval, 1e9) + 1e-6);
    for (const size_t n : {points / 3, points - 1})
        list.push_back(std::min(n, last));
    return list;
}

// The largest mean over so many seconds; nothing if the series is shorter.
std::optional<double> largestMeanNs(const tSeries& series, double seconds)
{
    const double wanted = std::ceil(seconds / series.interval);
    if (static_cast<double>(series.phase.size()) < wanted) return std::nullopt;
    const auto n = static_cast<size_t>(wanted);
    std::vector<double> sums(series.phase.size() + 1, 0);
    std::partial_sum(series.phase.begin(), series.phase.end(), sums.begin() + 1);
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
    std::optional<tWorst> worst;
    if (series.phase.size() < 2) return worst;
    for (const size_t n : averagingsUpTo(series, longestTau)) {
        const double tau = static_cast<double>(n) * series.interval;
        if (n < 1 || tau < kShortestTau || tau > longestTau) continue;
        const auto found = stabilityAt(series, n).*figure;
        if (!found) continue;
        const tWorst here = {tau, nsOf(*found), limitNs(tau)};
        if (!worst || here.foundNs * worst->limitNs > worst->foundNs * here.limitNs) worst = here;
    }
    return worst;
}

tMaskLine comparedWorst(const std::string& limit, const std::optional<tWorst>& worst)
{
    if (!worst) return {limit, "too few points", tMaskLine::kNotChecked};
    const bool held = worst->foundNs <= worst->limitNs;
    return {limit,
            fmt::format("{} at {}", durationText(worst->foundNs), durationText(nsOf(worst->tau))),
            held ? tMaskLine::kHeld : tMaskLine::kBroken};
}

// Those of the error as it is.
void addUnfiltered(std::vector<tMaskLine>& lines, const tMask& mask, const tMeasured& measured)
{
    if (mask.largestError > 0) {
        lines.push_back(compared(fmt::format("max |TE| {} ns", mask.largestError),
                                 largestNs(measured.errors), mask.largestError));
    }
    if (mask.constantError > 0) {
        const std::string limit = fmt::format("constant TE {} ns", mask.constantError);
        const auto mean = largestMeanNs(measured.series, kLongestTau);
        lines.push_back(mean ? compared(limit, *mean, mask.constantError)
                             : tMaskLine{limit, "less than 1000 s", tMaskLine::kNotChecked});
    }
    if (mask.tdevPerSecond > 0) {
        const auto limitNs = [&mask](double tau) { return mask.tdevPerSecond * tau; };
        lines.push_back(
            comparedWorst(fmt::format("TDEV {} ns per s of tau up to 10 s", mask.tdevPerSecond),
                          worstOf(measured.series, &tStability::tdev, kSlopeUpTo, limitNs)));
    }
}

void addFiltered(std::vector<tMaskLine>& lines, const tMask& mask, const tSeries& series)
{
    const bool canFilter = series.interval <= kLongestInterval;
    const tSeries low = lowPass(series, kCorner);
    const auto add = [&](double limitNs, const char* title, auto compare) {
        if (limitNs <= 0) return;
        const std::string limit = fmt::format("{} {} ns", title, limitNs);
        lines.push_back(canFilter ? compare(limit)
                                  : tMaskLine{limit, "pairs too far apart for a filter of 0.1 Hz",
                                              tMaskLine::kNotChecked});
    };
    const auto constant = [](double limitNs) {
        return [limitNs](double /*tau*/) { return limitNs; };
    };
    add(mask.lowPassedError, "max |TEL|", [&](const std::string& limit) {
        return compared(limit, largestNs(low.phase), mask.lowPassedError);
    });
    add(mask.lowPassedMtie, "dTEL MTIE up to 1000 s", [&](const std::string& limit) {
        return comparedWorst(
            limit, worstOf(low, &tStability::mtie, kLongestTau, constant(mask.lowPassedMtie)));
    });
    add(mask.lowPassedTdev, "dTEL TDEV up to 1000 s", [&](const std::string& limit) {
        return comparedWorst(
            limit, worstOf(low, &tStability::tdev, kLongestTau, constant(mask.lowPassedTdev)));
    });
    add(mask.highPassedPeakToPeak, "dTEH peak to peak", [&](const std::string& limit) {
        return compared(limit, peakToPeakNs(highPass(series, kCorner).phase),
                        mask.highPassedPeakToPeak);
    });
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

std::vector<tMaskCurve> maskCurves(const std::string& name)
{
    const tMask& mask = maskOf(name);
    std::vector<tMaskCurve> curves;
    if (mask.lowPassedMtie > 0) {
        curves.push_back({"MTIE", &tStability::mtie, true, kShortestTau, kLongestTau,
                          mask.lowPassedMtie, mask.lowPassedMtie});
    }
    if (mask.lowPassedTdev > 0) {
        curves.push_back({"TDEV", &tStability::tdev, true, kShortestTau, kLongestTau,
                          mask.lowPassedTdev, mask.lowPassedTdev});
    }
    if (mask.tdevPerSecond > 0) {
        curves.push_back({"TDEV", &tStability::tdev, false, kShortestTau, kSlopeUpTo,
                          mask.tdevPerSecond * kShortestTau, mask.tdevPerSecond * kSlopeUpTo});
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
    addUnfiltered(lines, mask, measured);
    if (measured.series.phase.size() > 1) {
        addFiltered(lines, mask, measured.series);
    } else {
        lines.push_back({"all over time", "too few points", tMaskLine::kNotChecked});
    }
    return lines;
}

} // namespace dravikHost
