// Masks: every limit just inside and just outside of it, in shapes whose figure is known in closed
// form, and what the data are too short or too coarse for.

#include "metrics/masks.h"
#include "metrics/stability.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <map>
#include <stdexcept>

using namespace dravikHost;

namespace {

// What follows a first point of 10 is an exponential that begins at the mean of the first second,
// both ends included: of five points here.
TEST(MaskFilter, startsSettledOnTheFirstSecond)
{
    const tSeries step{0.25, {10, 0, 0, 0, 0, 0}};
    const tSeries low = lowPass(step, 0.2);
    const tSeries high = highPass(step, 0.2);
    for (size_t i = 0; i < 6; ++i) {
        const double passed = 2 * std::exp(-2 * M_PI * 0.2 * 0.25 * static_cast<double>(i));
        EXPECT_NEAR(passed, low.phase[i], 1e-12);
        EXPECT_NEAR(step.phase[i] - passed, high.phase[i], 1e-12);
        const double masked = 2 * std::exp(-2 * M_PI * 0.1 * 0.25 * static_cast<double>(i));
        EXPECT_NEAR(masked, behindMaskFilter(step).phase[i], 1e-12);
    }
    EXPECT_EQ((std::vector<double>{2, 2, 2}), lowPass({0.5, {2, 2, 2}}, 0.2).phase);
    EXPECT_EQ(3, lowPass({1, {6, 0, 0}}, 0.2).phase[0]);
    EXPECT_EQ(6, lowPass({2, {6, 0, 0}}, 0.2).phase[0]);
    EXPECT_TRUE(lowPass({1, {}}, 0.2).phase.empty());
    EXPECT_NO_THROW(behindMaskFilter({1.004, {1}}));
    EXPECT_THROW(behindMaskFilter({1.006, {1}}), std::runtime_error);
}

// Phase errors whose figure, that a limit is for, is so many ns.
tMeasured shaped(double interval, size_t points, const std::function<double(double)>& phaseNs)
{
    tMeasured measured;
    measured.series.interval = interval;
    for (size_t i = 0; i < points; ++i)
        measured.series.phase.push_back(phaseNs(static_cast<double>(i)) * 1e-9);
    measured.errors = measured.series.phase;
    return measured;
}
tMeasured constant(double ns)
{
    return shaped(1, 1000, [ns](double) { return -ns; });
}
tMeasured oneSpike(double ns)
{
    return shaped(1, 1000, [ns](double i) { return i == 4 ? -ns : 0; });
}
tMeasured meanLate(double ns) // over 1000 s of two thousand, and nearly none over all
{
    return shaped(1, 2000, [ns](double i) { return i < 1000 ? -ns : ns; });
}
tMeasured ramp(double ns) // in 1000 s, and no further
{
    return shaped(1, 11000, [ns](double i) { return ns * std::clamp(i - 500, 0., 1000.) / 1000; });
}
tMeasured longRamp(double ns) // in 10,000 s
{
    return shaped(1, 10100, [ns](double i) { return ns * i / 10000; });
}
// The TDEV of x = a i^2 over n intervals is a n^2 sqrt(2/3).
tMeasured square(double ns, double n, size_t points)
{
    return shaped(1, points, [=](double i) { return ns * i * i / (n * n * std::sqrt(2 / 3.0)); });
}
tMeasured bent(double ns) { return square(ns, 1000, 3010); } // up to tau of 1000 s
tMeasured drifting(double nsPerSecond) { return square(nsPerSecond * 10, 10, 100); }
tMeasured alternating(double peakToPeakNs) // for a second, of which the low pass takes 1.6 %
{
    return shaped(0.05, 20'000, [=](double i) {
        return i < 100 || i >= 120 ? 0 : (std::fmod(i, 2) - 0.5) * peakToPeakNs / 0.984;
    });
}

const tMaskLine& lineOf(const std::vector<tMaskLine>& lines, const std::string& limit)
{
    for (const tMaskLine& line : lines)
        if (line.limit == limit) return line;
    throw std::runtime_error("no line of " + limit);
}

struct tLimitShape {
    const char *before, *after; // the number of ns
    tMeasured (*shape)(double ns);
    const char* at = "";
};
const tLimitShape kTe = {"max |TE| ", "", oneSpike};
const tLimitShape kMean = {"cTE ", ", mean over 1000 s", meanLate};
const tLimitShape kMtie = {"dTE_L MTIE up to 1000 s ", ", constant temperature", ramp,
                           " at 1000 s"};
const tLimitShape kLongMtie = {"dTE_L MTIE up to 10000 s ", ", variable temperature", longRamp,
                               " at 10000 s"};
const tLimitShape kTdev = {"dTE_L TDEV up to 1000 s ", ", constant temperature", bent,
                           " at 1000 s"};
const tLimitShape kHigh = {"dTE_H peak to peak ", ", constant temperature", alternating};
const tLimitShape kLow = {"max |TE_L| ", "", constant};
const tLimitShape kSlope = {"TDEV ", " per s of tau up to 10 s, free-running clock", drifting,
                            " at 10 s"};

using tLimits = std::vector<std::pair<const tLimitShape*, int>>;
tLimits ofClass(int te, int mean, int mtie, int tdev, int high)
{
    return {{&kTe, te},         {&kMean, mean}, {&kMtie, mtie},
            {&kLongMtie, mtie}, {&kTdev, tdev}, {&kHigh, high}};
}
const std::map<std::string, tLimits> kMasks = {
    {"g8273.2-a", ofClass(100, 50, 40, 4, 70)}, {"g8273.2-b", ofClass(70, 20, 40, 4, 70)},
    {"g8273.2-c", ofClass(30, 10, 10, 2, 30)},  {"g8273.2-d", {{&kLow, 5}}},
    {"g8273.3-a", ofClass(100, 50, 40, 4, 70)}, {"g8273.3-b", ofClass(70, 20, 40, 4, 70)},
    {"802.1as", {{&kTe, 1000}, {&kSlope, 5}}}};

TEST(Masks, holdJustInsideAndBreakJustOutside)
{
    EXPECT_EQ(kMasks.size(), maskNames().size());
    for (const std::string& name : maskNames()) {
        const size_t curves = name == "802.1as" ? 1 : name == "g8273.2-d" ? 0 : 2;
        EXPECT_EQ(curves, maskCurves(name).size()) << name;
        for (const auto& [limit, ns] : kMasks.at(name)) {
            const std::string title = fmt::format("{}{} ns{}", limit->before, ns, limit->after);
            SCOPED_TRACE(testing::Message() << name << " " << title);
            const auto inside = checkMask(name, limit->shape(0.99 * ns));
            const auto outside = checkMask(name, limit->shape(1.01 * ns));
            EXPECT_EQ(tMaskLine::kHeld, lineOf(inside, title).verdict);
            EXPECT_EQ(tMaskLine::kBroken, lineOf(outside, title).verdict);
            const std::string found = lineOf(outside, title).found;
            EXPECT_NE(std::string::npos, found.find(std::string("s") + limit->at)) << found;
            EXPECT_EQ(kMasks.at(name).size(), inside.size()); // and there are no others
        }
    }
}

// The data that hold a limit, and what one point less says. Breaking it takes less.
TEST(Masks, areNotJudgedOnTooFewData)
{
    const struct {
        const char *mask, *limit;
        size_t points;
        const char* found;
    } kRows[] = {
        {"g8273.2-c", "max |TE| 30 ns", 1000, "1 ns; needs 1000 s of data, has 999 s"},
        {"g8273.2-c", "cTE 10 ns, mean over 1000 s", 1000, "1 ns; needs 1000 s of data, has 999 s"},
        {"g8273.2-d", "max |TE_L| 5 ns", 1000, "1 ns; needs 1000 s of data, has 999 s"},
        {"g8273.3-a", "dTE_H peak to peak 70 ns, constant temperature", 1000,
         "0 ns; needs 1000 s of data, has 999 s"},
        {"g8273.3-a", "dTE_L MTIE up to 10000 s 40 ns, variable temperature", 10000,
         "0 ns at 9998 s; needs 10000 s of data, has 9999 s"},
        {"g8273.3-a", "dTE_L TDEV up to 1000 s 4 ns, constant temperature", 3000,
         "0 ns at 1 s; needs 3000 s of data, has 2999 s"},
        {"802.1as", "TDEV 5 ns per s of tau up to 10 s, free-running clock", 30,
         "0 ns at 1 s; needs 30 s of data, has 29 s"},
        {"802.1as", "TDEV 5 ns per s of tau up to 10 s, free-running clock", 3, "too few points"}};
    const auto flat = [](double interval, size_t points) {
        return shaped(interval, points, [](double) { return 1; });
    };
    for (const auto& row : kRows) {
        SCOPED_TRACE(row.limit);
        const auto on = [&](double interval, size_t points) {
            return lineOf(checkMask(row.mask, flat(interval, points)), row.limit);
        };
        EXPECT_EQ(row.found, on(1, row.points - 1).found);
        for (const double interval : {0.99999, 1.0, 1.00001}) { // as moments may be rounded
            EXPECT_EQ(tMaskLine::kNotJudged, on(interval, row.points - 1).verdict);
            EXPECT_EQ(row.points > 3 ? tMaskLine::kHeld : tMaskLine::kNotJudged,
                      on(interval, row.points).verdict);
        }
    }
    const auto verdict = [](const char* mask, const char* limit, const tMeasured& measured) {
        return lineOf(checkMask(mask, measured), limit).verdict;
    };
    const auto large = shaped(1, 9, [](double i) { return 50 * i; });
    EXPECT_EQ(tMaskLine::kBroken, verdict("g8273.2-c", "max |TE| 30 ns", large));
    EXPECT_EQ(tMaskLine::kNotJudged, verdict("g8273.2-c", "cTE 10 ns, mean over 1000 s", large));
    EXPECT_EQ(tMaskLine::kNotJudged, verdict("g8273.2-d", "max |TE_L| 5 ns", flat(1.01, 2000)));
    EXPECT_EQ(tMaskLine::kNotJudged, verdict("g8273.2-d", "all limits", flat(1, 1)));
}

TEST(Masks, areFilteredAndLimitTausWithinReason)
{
    const auto holds = [](const char* mask, const char* limit, const tMeasured& measured) {
        return lineOf(checkMask(mask, measured), limit).verdict == tMaskLine::kHeld;
    };
    const auto flip = [](double interval, double ns) { // a TDEV of 1.633 ns over one interval
        return shaped(interval, 700, [=](double i) { return std::fmod(i, 2) < 1 ? ns : -ns; });
    };
    const char* const slope = "TDEV 5 ns per s of tau up to 10 s, free-running clock";
    const char* const low = "max |TE_L| 5 ns";
    const char* const high = "dTE_H peak to peak 70 ns, constant temperature";
    EXPECT_TRUE(holds("g8273.2-d", low, alternating(60)));
    EXPECT_TRUE(holds("g8273.2-d", low, shaped(1, 1000, [](double i) { return i < 1 ? 6 : 0; })));
    EXPECT_TRUE(holds("g8273.2-a", high, constant(999)));
    EXPECT_TRUE(holds("g8273.2-a", high, ramp(200)));
    EXPECT_FALSE(holds("g8273.2-c", "dTE_L TDEV up to 1000 s 2 ns, constant temperature",
                       square(2.1, 200, 601))); // at a third of the points, which is no octave
    EXPECT_TRUE(holds("802.1as", slope, flip(0.05, 0.15)));
    EXPECT_FALSE(holds("802.1as", slope, flip(0.05, 0.16)));
    EXPECT_TRUE(holds("802.1as", slope, flip(0.049, 100)));
    EXPECT_FALSE(holds("802.1as", slope, // at 0.05 s, though it is larger, but allowed, at 10 s
                       shaped(0.05, 600, [](double i) {
                           return (std::fmod(i, 2) < 1 ? 0.17 : -0.17) + 40 * i * i / (200 * 200);
                       })));
}

} // namespace
