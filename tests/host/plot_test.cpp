// Scripts for gnuplot: what they draw, piece by piece.

#include "plot/plot.h"

#include <gtest/gtest.h>

#include <cmath>
#include <sstream>
#include <stdexcept>
#include <utility>

using namespace dravikHost;

namespace {

// A pair a second.
tRecording recordingOf(const std::vector<double>& errorsNs)
{
    tRecording recording{"it's.csv", "", {}, 0, {}};
    for (const double errorNs : errorsNs) {
        const auto elapsedNs = static_cast<int64_t>(recording.pairs.size()) * 1'000'000'000;
        recording.pairs.push_back({elapsedNs, 0, 0, errorNs, {}, {}, 0, {}});
    }
    return recording;
}

tRecording steered()
{
    tRecording recording = recordingOf({5000, 30, -40, 20, -10, 50});
    for (tRecordedPair& pair : recording.pairs) {
        pair.orderedPpb = pair.errorNs < 1000 ? 100 * pair.errorNs : -500'000;
        pair.locked = pair.errorNs < 1000;
    }
    recording.pairs.back().orderedPpb.reset();
    return recording;
}

// The pieces, in their order, and how often there is anything to plot.
void expectScript(const std::string& script, const std::vector<const char*>& pieces, int plots)
{
    size_t at = 0;
    for (const char* const piece : pieces) {
        const size_t found = script.find(piece, at);
        EXPECT_NE(std::string::npos, found) << "after " << script.substr(0, at) << "\nno " << piece;
        if (found != std::string::npos) at = found + std::string(piece).size();
    }
    for (at = script.find("\nplot $"); at != std::string::npos;
         at = script.find("\nplot $", at + 1))
        --plots;
    EXPECT_EQ(0, plots);
}

TEST(Plot, hasAllItsPanels)
{
    expectScript(plotScript(steered(), {"it's.svg", "802.1as"}),
                 {"set terminal svg dynamic size 1100,1000 ",
                  "set output 'it''s.svg'\n",
                  "$pairs << END\n0 5000 -500000 1\n1 30 3000 0\n2 -40 -4000 0\n3 20 2000 0\n",
                  "4 -10 -1000 0\n5 50 nan 0\nEND\n",
                  "set y2range [0:1]",
                  "set multiplot\nset size 1,0.333\nset origin 0,0.667\n",
                  "set ylabel 'phase error, ns'\nset yrange [-49:59]\n",
                  "'cut off: 1 of 6 points, at 0 s, up to 5 µs' at graph",
                  "set xlabel 'time, s'\nset title 'Phase error, it''s.csv'\n",
                  "plot $pairs using 1:4 axes x1y2 with fillsteps ",
                  "title 'not locked', \\\n    '' using 1:($2/1) with lines",
                  "'clock - reference, as measured'\nunset nonlinear y\nset yrange [*:*]",
                  "set origin 0,0.333\n",
                  "set yrange [-4.7:3.7]\n",
                  "'cut off: 1 of 6 points, at 0 s, down to -500 ppm' at graph",
                  "set title 'Frequency'",
                  "ppm'",
                  "plot $pairs using 1:4 axes x1y2 with fillsteps",
                  "'' using 1:($3/1000) with steps",
                  "'offset ordered'\nset yrange [*:*]",
                  "$stability << END\n1 ",
                  "2 ",
                  "END\n",
                  "set logscale xy",
                  "set xrange [0.909:10]",
                  "set origin 0,0.000\nset size 0.5,0.333\n",
                  "'Stability of the phase, mask 802.1as'",
                  "plot $stability using 1:2",
                  "title 'TDEV'",
                  "'' using 1:3",
                  "title 'MTIE'",
                  "[0.05:10] 0.25*(x/0.05)**1 with lines",
                  "'limit of TDEV, free-running clock'",
                  "set origin 0.5,0.000\nset size 0.5,0.333\n",
                  "'Stability of the frequency'",
                  "plot $stability using 1:4",
                  "title 'ADEV'",
                  "'' using 1:5",
                  "title 'MDEV'\nunset multiplot\n"},
                 4);
}

// What an axis of errors is like; the first error is that of the start.
TEST(Plot, fitsTheAxisToWhatComesAfterTheStart)
{
    const std::string wide =
        "set nonlinear y via asinh(y/20) inverse 20*sinh(y)\nset ytics (\"0\" 0";
    const struct {
        const char* name;
        std::vector<double> errorsNs;
        std::string axis;
    } kRows[] = {
        {"noise alone", {20, -20, 20, -20}, "set ylabel 'phase error, ns'\nset yrange [-24:24]\n"},
        {"one value", {-2000, -2000}, "phase error, µs'\nset yrange [-2.2:-1.8]\nset label 1 ''"},
        {"one small value", {5, 5}, "phase error, ns'\nset yrange [4:6]\n"},
        {"hardly anything", {0, 0, 0, 0, 1}, "phase error, ns'\nset yrange [-0.1:1.1]\n"},
        {"a start of a quarter",
         {1e6, 20, 20, 20},
         "set yrange [18:22]\nset label 1 'cut off: 1 of 4"},
        {"two decades and no more",
         {20, 20, 20, 20, -2000},
         ", \"2 µs\" 2000, \"-2 µs\" -2000)\nset ylabel"},
        {"far from zero",
         {3.7e10, 3.7e10 + 4},
         "phase error, s'\nset yrange [36.9999999996:37.0000000044]"},
        {"two decades",
         {-1e6, 20, 20, 20, -900, 20},
         wide +
             ", \"20 ns\" 20, \"-20 ns\" -20, \"50 ns\" 50, \"-50 ns\" -50, \"100 ns\" 100, \"-100 "
             "ns\" -100, \"200 ns\" 200, \"-200 ns\" -200, \"500 ns\" 500, \"-500 ns\" -500, \"1 "
             "µs\" 1000, \"-1 µs\" -1000)\nset ylabel \"phase error, linear\\nwithin ±20 ns\"\nset "
             "yrange [-1000:1000]\nset label 1 'cut off: 1 of 6 points, at 0 s, down to -1 ms'"},
        {"more decades",
         {1e6, 1e5, 20, 20, 20, 20, 20, 20, 20, -1e5},
         wide + ", \"100 ns\" 100, \"-100 ns\" -100, \"1 µs\" 1000, \"-1 µs\" -1000, \"10 µs\" "
                "10000, \"-10 µs\" -10000, \"100 µs\" 100000, \"-100 µs\" -100000)\nset ylabel "
                "\"phase error, linear\\nwithin ±20 ns\"\nset yrange [-100000:100000]\nset label 1 "
                "'cut off: 1 of 10 points, at 0 s, up to 1 ms'"},
        {"cut off twice",
         {1e6, 1e5, 20, 20, 20, 20, 20, 20, 20, 20},
         "'cut off: 2 of 10 points, from 0 s to 1 s, up to 1 ms'"},
        {"a start of half the trace",
         {1e6, 1e5, 20, 20, 20},
         "set yrange [-1000000:1000000]\nset label 1 ''"}};
    for (const auto& row : kRows) {
        const std::string script = plotScript(recordingOf(row.errorsNs), {"a.png", ""});
        EXPECT_NE(std::string::npos, script.find(row.axis)) << row.name << "\n" << script;
    }
}

TEST(Plot, measuresLongTracesInHoursAndDays)
{
    for (const auto& [seconds, axis, last] :
         {std::tuple<int64_t, const char*, const char*>{17'999, "'time, s'", "\n17999 2 "},
          {18'000, "'time, h'", "\n5 2 "},
          {431'999, "'time, h'", "\n119.999722 2 "},
          {432'000, "'time, d'", "\n5 2 "}}) {
        tRecording recording = recordingOf({1, 2});
        recording.pairs.back().elapsedNs = seconds * 1'000'000'000;
        expectScript(plotScript(recording, {"a.png", ""}), {last, axis}, 1);
    }
}

TEST(Plot, leavesOutWhatTheTraceDoesNotTell)
{
    tRecording still = recordingOf({7, 7, 7, 7});
    const std::string script = plotScript(still, {"a.png", ""});
    expectScript(script,
                 {"set terminal pngcairo size 1100,400 ", "\n0 7 nan 0\n",
                  "set size 1,1.000\nset origin 0,0.000"},
                 1);
    still.pairs.back().orderedPpb = 0;
    still.pairs.front().trueErrorNs = 3;
    expectScript(plotScript(still, {"a.png", ""}),
                 {"1100,700 ", "set size 1,0.500\nset origin 0,0.500", "'clock - true time'",
                  "set origin 0,0.000\nset yrange [-1:1]\n",
                  "set title 'Frequency'\nset ylabel 'frequency, ppb'", "unset multiplot"},
                 2);
    EXPECT_FALSE(hasStability({1, {0, 1}}));
    EXPECT_FALSE(hasStability({1, {1, 1, 1}}));
    EXPECT_TRUE(hasStability({1, {0, 1, 0}}));
}

// What does not move at a pair a second, but once.
TEST(Plot, showsTheLimitsOfTheFilteredError)
{
    const tSeries series{1, {0, 0, 0, 0, 1e-9}};
    expectScript(stabilityPanels(series, "g8273.2-b", {0.25, 0.5}),
                 {"$stability << END\n1 0.2357 1 4.082e-10 4.082e-10\n2 nan 1 3.536e-10 nan\nEND\n",
                  "$filtered << END\n1 0.11 0.4665 ", "set origin 0,0.250\nset size 0.5,0.500\n",
                  "title 'MTIE', \\\n    $filtered using 1:3 ", "'filtered MTIE'",
                  "[0.05:10000] 40*(x/0.05)**0 with", "'limit of MTIE'", "$filtered using 1:2 ",
                  "'filtered TDEV'", "[0.05:1000] 4*(x/0.05)**0 with", "'limit of TDEV'",
                  "set origin 0.5,0.250\n"},
                 2);
    EXPECT_EQ(std::string::npos, stabilityPanels(series, "", {0, 1}).find("filtered"));
    EXPECT_THROW(stabilityPanels({1.1, {0, 1, 0}}, "g8273.2-b", {0, 1}), std::runtime_error);
}

// Of each stretch of a long trace the extremes are left, in their order.
TEST(Plot, thinsLongTracesOut)
{
    std::vector<double> errorsNs(8001, 0);
    for (size_t i = 0; i < errorsNs.size(); ++i)
        errorsNs[i] = i % 3 == 1 ? 0 : (i % 3 == 0) == (i / 3 % 2 == 0) ? 5 : -5;
    errorsNs[6000] = 700;
    std::istringstream script(plotScript(recordingOf(errorsNs), {"a.svg", ""}));
    std::string line;
    while (std::getline(script, line) && line != "$pairs << END") {
    }
    double before = -1;
    int rows = 0;
    std::string spike;
    while (std::getline(script, line) && line != "END") {
        const double at = std::stod(line);
        EXPECT_LT(before, at);
        EXPECT_NE(1, std::lround(at) % 3) << line;
        before = at;
        ++rows;
        if (line.find(" 700 ") != std::string::npos) spike = line;
    }
    EXPECT_EQ(2 * 2667, rows);
    EXPECT_EQ("6000 700 nan 0", spike);
}

} // namespace
