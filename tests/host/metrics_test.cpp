// Figures of phase errors: against published ones, closed forms and traces worked out by hand.

#include "host/stepFixture.h"
#include "metrics/figures.h"
#include "metrics/masks.h"
#include "metrics/stability.h"
#include "metrics/tMeasured.h"

#include <cmath>
#include <functional>
#include <stdexcept>

using namespace dravikHost;

namespace {

constexpr std::optional<double> kNone;

// A thousand frequencies whose deviations are published, as a phase.
tSeries publishedPhase()
{
    tSeries frequency{1, {}};
    uint64_t number = 1234567890;
    for (int i = 0; i < 1000; ++i, number = number * 16807 % 2147483647)
        frequency.phase.push_back(static_cast<double>(number) / 2147483647);
    return phaseOf(frequency);
}

TEST(Stability, isThatPublished)
{
    const tSeries phase = publishedPhase();
    const struct {
        size_t n;
        double adev, oadev, mdev, tdev;
    } kDeviations[] = {
        {1, 2.922319e-01, 2.922319e-01, 2.922319e-01, 1.687202e-01},
        {10, 9.965736e-02, 9.159953e-02, 6.172376e-02, 3.563623e-01},
        {100, 3.897804e-02, 3.241343e-02, 2.170921e-02, 1.253382e+00},
    };
    for (const auto& row : kDeviations) {
        const tStability found = stabilityAt(phase, row.n);
        EXPECT_NEAR(row.adev, *found.adev, 1e-6 * row.adev) << row.n;
        EXPECT_NEAR(row.oadev, *found.oadev, 1e-6 * row.oadev) << row.n;
        EXPECT_NEAR(row.mdev, *found.mdev, 1e-6 * row.mdev) << row.n;
        EXPECT_NEAR(row.tdev, *found.tdev, 1e-6 * row.tdev) << row.n;
    }
    for (const auto& [n, mtie] : {std::pair(1, 0.50597),
                                  {3, 1.2984},
                                  {7, 2.2922},
                                  {15, 2.9949},
                                  {63, 6.5989},
                                  {255, 7.8205}})
        EXPECT_NEAR(mtie, *stabilityAt(withoutSlope(phase), static_cast<size_t>(n)).mtie, 1e-4);
}

// x = i^2 at half a second: all second differences over n are 2 n^2.
TEST(Stability, endsWithTheSeries)
{
    const size_t n = 4;
    const double tau = 2;
    const double adev = 32 / (std::sqrt(2.0) * tau);
    tSeries series{0.5, {}};
    for (size_t points = 1; points <= 14; ++points) {
        const auto last = static_cast<double>(points - 1);
        series.phase.push_back(last * last);
        const tStability found = stabilityAt(series, n);
        const double wide = points >= 9 ? adev : 0;
        const double full = points >= 12 ? adev : 0;
        EXPECT_EQ(wide > 0, found.adev.has_value()) << points;
        EXPECT_EQ(full > 0, found.mdev.has_value()) << points;
        EXPECT_DOUBLE_EQ(wide, found.adev.value_or(0));
        EXPECT_DOUBLE_EQ(wide, found.oadev.value_or(0));
        EXPECT_DOUBLE_EQ(full, found.mdev.value_or(0));
        EXPECT_DOUBLE_EQ(full * tau / std::sqrt(3.0), found.tdev.value_or(0));
        EXPECT_DOUBLE_EQ(points >= 5 ? last * last - (last - 4) * (last - 4) : 0,
                         found.mtie.value_or(0));
        EXPECT_EQ((points - 1) / 2, largestAveraging(series));
    }
    EXPECT_EQ((std::vector<size_t>{1, 2, 4}), octaves(series));
    EXPECT_TRUE(octaves({1, {0, 0}}).empty());
    EXPECT_EQ(0U, largestAveraging({}));
}

TEST(Series, areFilteredAndFlattened)
{
    EXPECT_EQ((std::vector<double>{0, 1, 0, 4}), phaseOf({0.5, {2, -2, 8}}).phase);
    EXPECT_EQ((std::vector<double>{1, 3, -1, 1}), withoutSlope({1, {1, 5, 3, 7}}).phase);
    EXPECT_EQ((std::vector<double>{3}), withoutSlope({1, {3}}).phase);
    const tSeries step{0.5, {0, 1, 1, 1}}; // a step answers with an exponential
    const tSeries sloped{0.5, {2, 2, 2}};
    for (size_t i = 0; i < 4; ++i) {
        const double passed = 1 - std::exp(-2 * M_PI * 0.2 * 0.5 * static_cast<double>(i));
        EXPECT_NEAR(passed, lowPass(step, 0.2).phase[i], 1e-12);
        EXPECT_NEAR(step.phase[i] - passed, highPass(step, 0.2).phase[i], 1e-12);
        EXPECT_NEAR(1 - std::exp(-2 * M_PI * 0.1 * 0.5 * static_cast<double>(i)),
                    behindMaskFilter(step).phase[i], 1e-12);
    }
    EXPECT_EQ(sloped.phase, lowPass(sloped, 0.2).phase);
    EXPECT_NO_THROW(behindMaskFilter({1, {1}}));
    EXPECT_THROW(behindMaskFilter({1.01, {1}}), std::runtime_error);
}

struct tPoint {
    double seconds, errorNs, trueNs;
    bool locked;
};
tRecording recordingOf(const std::vector<tPoint>& points)
{
    tRecording recording{"trace", "", {}, 0, {}};
    for (const tPoint& point : points) {
        tRecordedPair pair{std::llround(point.seconds * 1e9), 0, 0, point.errorNs, {}, {}, 0, {}};
        pair.trueErrorNs = point.trueNs;
        pair.locked = point.locked;
        recording.pairs.push_back(pair);
    }
    return recording;
}
const tRecording kTrace = recordingOf({{0, 5000, 100, false},
                                       {1, 4000, 100, false},
                                       {2, 30, 1, true},
                                       {3, -40, -2, true},
                                       {4, 0, 3, true},
                                       {5, 10, -4, true},
                                       {8, -20, 5, true},
                                       {9, 40, -6, true},
                                       {10, 3000, 7, false},
                                       {11, 20, 8, true}});

TEST(Measured, isWhatIsSelected)
{
    const auto s = [](int64_t seconds) { return std::optional<int64_t>(seconds * 1'000'000'000); };
    const struct {
        const char* name;
        tSelection selection;
        const char* what;
        double from, to;
        size_t points, stretch;
        double meanNs, meanSquare, peakNs, peakToPeakNs;
    } kRows[] = {
        {"from the lock on", {}, "true error", 2, 11, 8, 4, 1.5, 25.5, 8, 14},
        {"as measured", {true, {}, {}}, "measured error", 2, 11, 8, 4, 380, 1125625, 3000, 3040},
        {"all", {true, s(0), {}}, "measured error", 0, 11, 10, 6, 1204, 5000500, 5000, 5040},
        {"a part", {true, s(3), s(9)}, "measured error", 3, 9, 5, 3, -2, 740, 40, 80},
        {"below zero", {true, s(3), s(5)}, "measured error", 3, 5, 3, 3, -10, 1700 / 3.0, 40, 50},
        {"one point", {true, s(8), s(8)}, "measured error", 8, 8, 1, 0, -20, 400, 20, 0},
    };
    for (const auto& row : kRows) {
        const tMeasured found = measure(kTrace, row.selection);
        SCOPED_TRACE(row.name);
        EXPECT_EQ(row.what, found.what);
        EXPECT_DOUBLE_EQ(row.from, found.fromSeconds);
        EXPECT_DOUBLE_EQ(row.to, found.toSeconds);
        EXPECT_EQ(row.points, found.errors.size());
        EXPECT_EQ(row.stretch, found.series.phase.size());
        EXPECT_NEAR(row.meanNs, *found.mean() * 1e9, 1e-9);
        EXPECT_NEAR(std::sqrt(row.meanSquare), found.rms() * 1e9, 1e-6);
        EXPECT_NEAR(row.peakNs, found.peak() * 1e9, 1e-9);
        EXPECT_NEAR(row.peakToPeakNs, *found.peakToPeak() * 1e9, 1e-9);
        EXPECT_DOUBLE_EQ(2, *found.timeToLock); // whatever was selected
        EXPECT_EQ(1, *found.locksLost);
    }
    EXPECT_THROW(measure(kTrace, {false, s(12), {}}), std::runtime_error);
}

TEST(Measured, dependsOnWhatTheTraceTells)
{
    tRecording recording = kTrace;
    recording.pairs.back().trueErrorNs.reset();
    EXPECT_EQ("measured error", measure(recording, {}).what);
    for (tRecordedPair& pair : recording.pairs)
        pair.locked = false;
    const tMeasured never = measure(recording, {});
    EXPECT_EQ(10U, never.errors.size());
    EXPECT_FALSE(never.timeToLock);
    EXPECT_EQ(0, *never.locksLost);
    recording.pairs.back().locked.reset();
    EXPECT_FALSE(measure(recording, {}).locksLost);
}

// Half a spacing more or less is no gap; the interval is the mean one, and the first of equally
// long stretches counts.
TEST(Measured, hasTheLongestStretchWithoutAGap)
{
    const struct {
        std::vector<double> seconds;
        double first, interval;
        size_t points;
    } kRows[] = {
        {{0, 1.5, 2.5, 3.5, 5.01, 6.01}, 0, 3.5 / 3, 4},
        {{0, 1, 2.51, 3.01, 4.01}, 2.51, 0.75, 3},
        {{0, 1, 2, 2.49, 3.49, 4.49}, 0, 1, 3},
    };
    for (const auto& row : kRows) {
        std::vector<tPoint> points;
        for (const double at : row.seconds)
            points.push_back({at, at, at, true});
        const tSeries series = measure(recordingOf(points), {}).series;
        EXPECT_EQ(row.points, series.phase.size());
        EXPECT_NEAR(row.first, series.phase.front() * 1e9, 1e-9);
        EXPECT_NEAR(row.interval, series.interval, 1e-9);
    }
}

TEST(Measured, losesItsSlope)
{
    tMeasured measured =
        measure(recordingOf({{0, 1, 1, true}, {1, 5, 5, true}, {4, 9, 9, true}}), {});
    measured.series = {1, {1, 5, 3, 7}};
    measured.removeSlope();
    EXPECT_NEAR(0, measured.errors[0], 1e-18);
    EXPECT_NEAR(2e-9, measured.errors[1], 1e-18);
    EXPECT_EQ(3, measured.series.phase[1]);
    measured.errors.resize(1);
    EXPECT_THROW(measured.removeSlope(), std::runtime_error);
}

TEST(Numbers, areOneALine)
{
    const tTestFile file("numbers", "# phase\n1e-9\n\n  -3e-9 \n2e-9");
    const auto measureNumbers = [&file](double interval, bool frequency) {
        tReadOptions options;
        options.intervalNs = interval * 1e9;
        options.frequency = frequency;
        return measure(readRecording(file.path, options), {});
    };
    const tMeasured phase = measureNumbers(0.5, false);
    ASSERT_EQ(3U, phase.errors.size());
    EXPECT_DOUBLE_EQ(-3e-9, phase.errors[1]);
    EXPECT_EQ((std::vector<double>{0, 0.5, 1}), phase.times);
    EXPECT_EQ(1, phase.toSeconds);
    EXPECT_DOUBLE_EQ(-1e-9, measureNumbers(0.5, true).errors[2]);
    for (const char* const text : {"", "# none\n", "1\nx\n", "1 2\n", "nan\n"}) {
        writeText(file.path, text);
        EXPECT_THROW(measureNumbers(1, false), std::runtime_error) << text;
    }
}

TEST(Figures, haveNamesAndTaus)
{
    tMeasured measured = measure(kTrace, {});
    measured.series = publishedPhase();
    const struct {
        const char* figure;
        bool isTime;
        std::optional<double> value;
    } kRows[] = {
        {"rms", true, std::sqrt(25.5) * 1e-9},
        {"peak", true, 8e-9},
        {"peak-to-peak", true, 14e-9},
        {"mean", true, 1.5e-9},
        {"time-to-lock", true, 2},
        {"locks-lost", false, 1},
        {"adev(10s)", false, 0.09965736},
        {"oadev(10s)", false, 0.09159953},
        {"mdev(10s)", false, 0.06172376},
        {"tdev(10s)", true, 0.3563623},
        {"tdev(10.009s)", true, 0.3563623}, // as moments may be rounded
        {"tdev(10.011s)", true, kNone},
        {"tdev(300.24s)", true, stabilityAt(measured.series, 300).tdev},
        {"tdev(300.26s)", true, kNone},
        {"tdev(400us)", true, kNone},
        {"mtie(1000s)", true, stabilityAt(measured.series, 1000).mtie},
        {"mtie(1001s)", true, kNone},
        {"mtie(4294967306s)", true, kNone},
        {"adev(501s)", false, kNone},
    };
    for (const auto& row : kRows) {
        const tFigure figure = parseFigure(row.figure);
        EXPECT_EQ(row.isTime, figure.isTime) << row.figure;
        const auto found = valueOf(figure, measured);
        ASSERT_EQ(row.value.has_value(), found.has_value()) << row.figure;
        EXPECT_NEAR(row.value.value_or(0), found.value_or(0), 1e-6 * row.value.value_or(0))
            << row.figure;
    }
    measured.timeToLock.reset();
    measured.locksLost.reset();
    EXPECT_FALSE(valueOf(parseFigure("time-to-lock"), measured));
    EXPECT_FALSE(valueOf(parseFigure("locks-lost"), measured));
    for (const char* const text : {"", "rmse", "tdev", "rms(1s)", "tdev(1s", "tdev(1)", "tdev()"})
        EXPECT_THROW(parseFigure(text), std::invalid_argument) << text;
}

TEST(Assertions, holdOrTellWhatWasFound)
{
    const tMeasured measured = measure(kTrace, {});
    const std::pair<const char*, const char*> kRows[] = {
        {"peak<=8ns", ""},
        {"peak>=8ns", ""},
        {"peak<8ns", " does not hold: it is 8 ns"},
        {"peak>8ns", " does not hold: it is 8 ns"},
        {"peak<9ns", ""},
        {"peak<=7ns", " does not hold: it is 8 ns"},
        {"peak>=9ns", " does not hold: it is 8 ns"},
        {"mean>1ns", ""},
        {"locks-lost<1", " does not hold: it is 1"},
        {"mtie(1s)<=7ns", ""},
        {"adev(9s)<1", " cannot be computed from these data"},
    };
    for (const auto& [text, failure] : kRows)
        EXPECT_EQ(*failure == '\0' ? "" : text + std::string(failure),
                  tAssertion(text).failure(measured));
    for (const char* const text : {"rms", "rms<20", "rms<", "rmse<1ns", "adev(1s)<1ns", "=1"})
        EXPECT_THROW(tAssertion{text}, std::invalid_argument) << text;
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
    return shaped(1, 1001, [ns](double) { return -ns; });
}
tMeasured oneSpike(double ns)
{
    return shaped(1, 9, [ns](double i) { return i == 4 ? -ns : 0; });
}
tMeasured ramp(double ns) // in 1000 s
{
    return shaped(1, 1201, [ns](double i) { return ns * i / 1000; });
}
// The TDEV of x = a i^2 over n intervals is a n^2 sqrt(2/3).
tMeasured square(double ns, double n, size_t points)
{
    return shaped(1, points, [=](double i) { return ns * i * i / (n * n * std::sqrt(2 / 3.0)); });
}
tMeasured bent(double ns) { return square(ns, 1000, 3601); } // up to tau of 1000 s
tMeasured drifting(double nsPerSecond) { return square(nsPerSecond * 10, 10, 100); }
tMeasured alternating(double peakToPeakNs) // as good as not filtered
{
    return shaped(0.01, 300, [=](double i) {
        return i == 0 ? 0 : std::fmod(i, 2) < 1 ? peakToPeakNs / 2 : -peakToPeakNs / 2;
    });
}

struct tLimitRow {
    const char* mask;
    const char* limit;
    double limitNs;
    tMeasured (*shape)(double ns);
    const char* at = "";
};
const tLimitRow kLimits[] = {
    {"g8273.2-a", "max |TE| 100 ns", 100, oneSpike},
    {"g8273.2-a", "constant TE 50 ns", 50, constant},
    {"g8273.2-a", "dTEL MTIE up to 1000 s 40 ns", 40, ramp, " at 1000 s"},
    {"g8273.2-a", "dTEL TDEV up to 1000 s 4 ns", 4, bent, " at 1000 s"},
    {"g8273.2-a", "dTEH peak to peak 70 ns", 70, alternating},
    {"g8273.2-b", "max |TE| 70 ns", 70, oneSpike},
    {"g8273.2-b", "constant TE 20 ns", 20, constant},
    {"g8273.2-b", "dTEL MTIE up to 1000 s 40 ns", 40, ramp, " at 1000 s"},
    {"g8273.2-b", "dTEL TDEV up to 1000 s 4 ns", 4, bent, " at 1000 s"},
    {"g8273.2-b", "dTEH peak to peak 70 ns", 70, alternating},
    {"g8273.2-c", "max |TE| 30 ns", 30, oneSpike},
    {"g8273.2-c", "constant TE 10 ns", 10, constant},
    {"g8273.2-c", "dTEL MTIE up to 1000 s 10 ns", 10, ramp, " at 1000 s"},
    {"g8273.2-c", "dTEL TDEV up to 1000 s 2 ns", 2, bent, " at 1000 s"},
    {"g8273.2-d", "max |TEL| 5 ns", 5, constant},
    {"802.1as", "max |TE| 1000 ns", 1000, oneSpike},
    {"802.1as", "TDEV 5 ns per s of tau up to 10 s", 5, drifting, " at 10 s"},
};

const tMaskLine& lineOf(const std::vector<tMaskLine>& lines, const std::string& limit)
{
    for (const tMaskLine& line : lines)
        if (line.limit == limit) return line;
    throw std::runtime_error("no line of " + limit);
}

TEST(Masks, holdJustInsideAndBreakJustOutside)
{
    for (const tLimitRow& row : kLimits) {
        SCOPED_TRACE(std::string(row.mask) + " " + row.limit);
        const auto inside = checkMask(row.mask, row.shape(0.99 * row.limitNs));
        const auto outside = checkMask(row.mask, row.shape(1.01 * row.limitNs));
        EXPECT_EQ(tMaskLine::kHeld, lineOf(inside, row.limit).verdict);
        EXPECT_EQ(tMaskLine::kBroken, lineOf(outside, row.limit).verdict);
        const std::string found = lineOf(outside, row.limit).found;
        EXPECT_NE(std::string::npos, found.find(std::string("s") + row.at)) << found;
        const auto rows = std::count_if(std::begin(kLimits), std::end(kLimits), [&row](auto& r) {
            return r.mask == std::string(row.mask);
        });
        EXPECT_EQ(static_cast<size_t>(rows), inside.size()); // and there are no others
    }
    EXPECT_EQ(
        (std::vector<std::string>{"g8273.2-a", "g8273.2-b", "g8273.2-c", "g8273.2-d", "802.1as"}),
        maskNames());
}

TEST(Masks, areFilteredAndLimitTausWithinReason)
{
    const auto flat = [](double interval, size_t points) {
        return shaped(interval, points, [](double) { return 1; });
    };
    const auto flip = [](double interval, double ns) { // a TDEV of 1.633 ns over one interval
        return shaped(interval, 204, [=](double i) { return std::fmod(i, 2) < 1 ? ns : -ns; });
    };
    const auto late = [](double i) { return i < 1000 ? 0 : 11; };
    const auto bentFlip = [](double i) {
        return (std::fmod(i, 2) < 1 ? 0.17 : -0.17) + 40 * i * i / (200 * 200);
    };
    const char* const slope = "TDEV 5 ns per s of tau up to 10 s";
    const char* const mtie = "dTEL MTIE up to 1000 s 40 ns";
    const char* const high = "dTEH peak to peak 70 ns";
    const struct {
        const char *mask, *limit;
        tMeasured measured;
        int verdict;
    } kRows[] = {
        {"g8273.2-d", "max |TEL| 5 ns", alternating(60), tMaskLine::kHeld},
        {"g8273.2-a", high, constant(999), tMaskLine::kHeld},
        {"g8273.2-a", high, ramp(200), tMaskLine::kHeld},
        {"g8273.2-a", mtie, alternating(60), tMaskLine::kHeld},
        {"g8273.2-a", "dTEL TDEV up to 1000 s 4 ns", flip(0.05, 5), tMaskLine::kHeld},
        // At a third of the points, which is no octave.
        {"g8273.2-c", "dTEL TDEV up to 1000 s 2 ns", square(2.1, 200, 601), tMaskLine::kBroken},
        // At 0.05 s, though it is much larger, but allowed, at 10 s.
        {"802.1as", slope, shaped(0.05, 600, bentFlip), tMaskLine::kBroken},
        {"g8273.2-d", "max |TEL| 5 ns", flat(1, 40), tMaskLine::kHeld},
        {"g8273.2-d", "max |TEL| 5 ns", flat(1.01, 40), tMaskLine::kNotChecked},
        {"802.1as", slope, flip(0.05, 0.15), tMaskLine::kHeld},
        {"802.1as", slope, flip(0.05, 0.16), tMaskLine::kBroken},
        {"802.1as", slope, flip(0.049, 100), tMaskLine::kHeld},
        {"802.1as", slope, flat(1, 2), tMaskLine::kNotChecked},
        {"g8273.2-c", "constant TE 10 ns", flat(1, 1000), tMaskLine::kHeld},
        {"g8273.2-c", "constant TE 10 ns", flat(1, 999), tMaskLine::kNotChecked},
        {"g8273.2-c", "constant TE 10 ns", shaped(1, 2000, late), tMaskLine::kBroken},
        {"g8273.2-d", "all over time", flat(1, 1), tMaskLine::kNotChecked},
    };
    for (const auto& row : kRows)
        EXPECT_EQ(row.verdict, lineOf(checkMask(row.mask, row.measured), row.limit).verdict)
            << row.mask << " " << row.limit << " row " << &row - kRows;
}

} // namespace
