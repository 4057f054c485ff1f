// Figures of phase errors: against published ones, closed forms and traces worked out by hand.

#include "host/stepFixture.h"
#include "metrics/figures.h"
#include "metrics/stability.h"
#include "metrics/tMeasured.h"

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
    } kDeviations[] = {{1, 2.922319e-01, 2.922319e-01, 2.922319e-01, 1.687202e-01},
                       {10, 9.965736e-02, 9.159953e-02, 6.172376e-02, 3.563623e-01},
                       {100, 3.897804e-02, 3.241343e-02, 2.170921e-02, 1.253382e+00}};
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

TEST(Series, areSummedAndFlattened)
{
    EXPECT_EQ((std::vector<double>{0, 1, 0, 4}), phaseOf({0.5, {2, -2, 8}}).phase);
    EXPECT_EQ((std::vector<double>{1, 3, -1, 1}), withoutSlope({1, {1, 5, 3, 7}}).phase);
    EXPECT_EQ((std::vector<double>{3, 3}), withoutSlope({1, {3, 5}}).phase);
    EXPECT_EQ((std::vector<double>{3}), withoutSlope({1, {3}}).phase);
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
        {"one point", {true, s(8), s(8)}, "measured error", 8, 8, 1, 0, -20, 400, 20, 0}};
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
    } kRows[] = {{{0, 1.5, 2.5, 3.5, 5.01, 6.01}, 0, 3.5 / 3, 4},
                 {{0, 1, 2.51, 3.01, 4.01}, 2.51, 0.75, 3},
                 {{0, 1, 2, 2.49, 3.49, 4.49}, 0, 1, 3}};
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
        measure(recordingOf({{2, 1, 1, true}, {3, 5, 5, true}, {6, 9, 9, true}}), {});
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
    const tTestFile file("numbers");
    tReadOptions options;
    options.intervalNs = 1e9;
    for (const char* const text : {"", "# none\n", "1\nx\n", "1 2\n", "nan\n"}) {
        writeText(file.path, text);
        EXPECT_THROW(readRecording(file.path, options), std::runtime_error) << text;
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
        // clang-format off
    } kRows[] = {
        {"rms", true, std::sqrt(25.5) * 1e-9}, {"peak", true, 8e-9}, {"peak-to-peak", true, 14e-9},
        {"mean", true, 1.5e-9}, {"time-to-lock", true, 2}, {"locks-lost", false, 1},
        {"adev(10s)", false, 0.09965736}, {"oadev(10s)", false, 0.09159953},
        {"mdev(10s)", false, 0.06172376}, {"tdev(10s)", true, 0.3563623},
        {"tdev(10.009s)", true, 0.3563623 /* as moments may be rounded */},
        {"tdev(10.011s)", true, kNone},
        {"tdev(300.24s)", true, stabilityAt(measured.series, 300).tdev},
        {"tdev(300.26s)", true, kNone}, {"tdev(400us)", true, kNone},
        {"mtie(1000s)", true, stabilityAt(measured.series, 1000).mtie},
        {"mtie(1001s)", true, kNone}, {"mtie(4294967306s)", true, kNone},
        {"adev(501s)", false, kNone}};
    // clang-format on
    for (const auto& row : kRows) {
        const tFigure figure = parseFigure(row.figure);
        EXPECT_EQ(row.isTime, figure.isTime) << row.figure;
        const auto found = valueOf(figure, measured);
        ASSERT_EQ(row.value.has_value(), found.has_value()) << row.figure;
        EXPECT_NEAR(row.value.value_or(0), found.value_or(0), 1e-6 * row.value.value_or(0))
            << row.figure;
    }
    measured.series = {1, {1e-9, 3e-9}};
    EXPECT_DOUBLE_EQ(2e-9, valueOf(parseFigure("mtie(1s)"), measured).value_or(0));
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
    // clang-format off
    const std::pair<const char*, const char*> kRows[] = {
        {"peak<=8ns", ""}, {"peak>=8ns", ""}, {"peak<8ns", " does not hold: it is 8 ns"},
        {"peak>8ns", " does not hold: it is 8 ns"}, {"peak<9ns", ""},
        {"peak<=7ns", " does not hold: it is 8 ns"}, {"peak>=9ns", " does not hold: it is 8 ns"},
        {"mean>1ns", ""}, {"locks-lost<1", " does not hold: it is 1"}, {"mtie(1s)<=7ns", ""},
        {"adev(9s)<1", " cannot be computed from these data"}};
    // clang-format on
    for (const auto& [text, failure] : kRows) {
        EXPECT_EQ(*failure == '\0' ? "" : text + std::string(failure),
                  tAssertion(text).failure(measured));
    }
    for (const char* const text : {"rms", "rms<20", "rms<", "rmse<1ns", "adev(1s)<1ns", "=1"})
        EXPECT_THROW(tAssertion{text}, std::invalid_argument) << text;
}

} // namespace
