// Scripts for gnuplot: what they draw, piece by piece.

#include "plot/plot.h"

#include <gtest/gtest.h>

#include <cmath>
#include <sstream>
#include <stdexcept>

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
    expectScript(
        plotScript(steered(), {"it's.svg", "802.1as"}),
        {"set terminal svg dynamic size 1100,1000 ",
         "set output 'it''s.svg'\n",
         "$pairs << END\n"
         "0 5000 -500 1\n1 30 3 0\n2 -40 -4 0\n3 20 2 0\n4 -10 -1 0\n5 50 nan 0\nEND\n",
         "set multiplot\nset size 1,0.333\nset origin 0,0.667\n",
         "set title 'Phase error, it''s.csv'",
         "set nonlinear y via asinh(y/40) inverse 40*sinh(y)",
         "set ytics (\"0\" 0, \"100 ns\" 1e2, \"-100 ns\" -1e2, \"1 µs\" 1e3, \"-1 µs\" -1e3, ",
         "\"-100 s\" -1e11)",
         "using 1:4 axes x1y2 with fillsteps lc rgb shade title 'not locked'",
         "'' using 1:2 with lines",
         "'clock - reference, as measured'\nunset nonlinear y",
         "set origin 0,0.333\n",
         "set yrange [-4.7:3.7]\nset title 'Frequency'",
         "plot $pairs using 1:4 axes x1y2 with fillsteps",
         "'' using 1:3 with steps",
         "'offset ordered'\nset yrange [*:*]",
         "$stability << END\n1 ",
         "2 ",
         "END\n",
         "set logscale xy",
         "set xrange [1:2]",
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
                  "set origin 0,0.000\nset title 'Frequency'", "unset multiplot"},
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

TEST(Plot, isOfTwoKinds)
{
    for (const char* const name : {"a.svg", "a.b.png", "/c/d.svg"})
        EXPECT_TRUE(isPictureName(name)) << name;
    for (const char* const name : {"a", ".svg", ".png", "a.gif", "a.SVG", "a.svg.gz", "asvg"})
        EXPECT_FALSE(isPictureName(name)) << name;
}

} // namespace
