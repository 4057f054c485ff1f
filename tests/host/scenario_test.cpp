#include "maths/sameBits.h"
#include "metrics/stability.h"
#include "sources/tSimulatedSource.h"
#include "support/failureOf.h"
#include "text/quantity.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <cmath>

using namespace dravikHost;

namespace {

using tPairs = std::vector<tPair>;

// Each second of 4000, of a clock without fault beside a reference without noise, but for the text.
tPairs pairsOf(const std::string& text)
{
    tScenarioStart start;
    start.phase.measurement.intervalNs = kSecondNs;
    start.phase.measurement.durationNs = 4000 * kSecondNs;
    const tScenario scenario = parseScenario(text, "it", start);
    tOscillatorModel oscillator = scenario[0].oscillator;
    oscillator.frequencyErrorPpb = scenario[0].frequencyPpb;
    tNoise noise(5);
    tSimulatedClock clock(tSimulatedSource::kStartNs + static_cast<uint64_t>(scenario[0].stepNs),
                          oscillator, 1000, noise, 5);
    tSimulatedSource source(clock, scenario, noise, 5);
    tPairs pairs;
    while (const auto moment = source.next())
        if (moment->pair) pairs.push_back(*moment->pair);
    return pairs;
}

// What is measured beyond the true error, from a pair on, in ns; and the true error.
tSeries noiseOf(const tPairs& pairs, size_t from = 0)
{
    tSeries series{1e9, {}};
    for (size_t i = from; i < pairs.size(); ++i)
        series.phase.push_back(static_cast<double>(pairs[i].errorNs()) - *pairs[i].trueErrorNs);
    return series;
}
tSeries truthOf(const tPairs& pairs)
{
    tSeries series{1, {}};
    for (const tPair& pair : pairs)
        series.phase.push_back(*pair.trueErrorNs);
    return series;
}

double bias(const tPairs& pairs)
{
    double sum = 0;
    for (const double each : noiseOf(pairs).phase)
        sum += each;
    return sum / static_cast<double>(pairs.size());
}
double spread(const tPairs& pairs, size_t from)
{
    const tSeries noise = noiseOf(pairs, from);
    double sum = 0;
    double squares = 0;
    for (const double each : noise.phase)
        sum += each, squares += each * each;
    const auto count = static_cast<double>(noise.phase.size());
    return std::sqrt(squares / count - sum * sum / count / count);
}
double early(const tPairs& pairs) { return spread(pairs, 0); }
double later(const tPairs& pairs) { return spread(pairs, 2000); }
double count(const tPairs& pairs) { return static_cast<double>(pairs.size()); }
double at499(const tPairs& pairs) { return *pairs.at(499).trueErrorNs; }
double at500(const tPairs& pairs) { return *pairs.at(500).trueErrorNs; }
double at1000(const tPairs& pairs) { return *pairs.at(1000).trueErrorNs; }
double tdev8(const tPairs& pairs) { return *stabilityAt(noiseOf(pairs), 8).tdev; }
double adev1(const tPairs& pairs) { return *stabilityAt(truthOf(pairs), 1).oadev; }
double adev64(const tPairs& pairs) { return *stabilityAt(truthOf(pairs), 64).oadev; }

TEST(Scenario, doesWhatItsStatementsSay)
{
    const struct {
        const char* text;
        double (*figure)(const tPairs& pairs);
        double expected, tolerance;
    } kRows[] = {
        {"reference noise=50ns", early, 50, 2},
        {"reference noise=50ns\nat 2000s reference noise=1us", later, 1000, 40},
        {"reference outliers=10% size=1us", early, 316, 15},
        {"reference outliers=10% size=1us", bias, 0, 15},
        {"reference delayed=10% size=1us", bias, 100, 15},
        {"reference delay=100ns", bias, 100, 5},
        {"reference delay=100ns", early, 100, 7},
        {"reference delay=100ns delayed=10% size=1us", early, 316, 15}, // by chances of their own
        {"reference flicker=100ns", tdev8, 100, 8},
        {"reference missing=25%", count, 3000, 80},
        {"at 1000s reference interval=500ms", count, 7000, 0},
        {"at 500s silence # so long\n\nat 510s resume", count, 3990, 0},
        {"at 500s jump 10us", at499, 0, 0},
        {"at 500s jump 10us", at500, -10'000, 1e-6},
        {"at 500s jump 10us", bias, 0, 1e-6},
        {"clock offset=1us\nat 500s clock offset=2us", at1000, 3000, 1e-6},
        {"clock offset=1us frequency=10ppb\nat 500s jump 10us\nat 600s resume", at1000, 1000, 1e-3},
        {"clock frequency=100ppb\nat 500s clock frequency=-50ppb", at1000, 75'000, 1e-3},
        {"at 500s clock ramp=1ppb\nat 600s clock ramp=0", at1000, 45'000, 1e-3},
        {"clock sine=50ppb period=1000s", at500, 50'000 / 3.14159265, 1e-3},
        {"clock sine=50ppb period=1000s", at1000, 0, 1e-3},
        {"clock white=10ppb", adev1, 10, 0.5},
        {"clock white=64ppb\nat 1ns clock white=8ppb", adev64, 1, 0.15},
        {"clock wander=10ppb", adev64, 46.2, 7}, // root of 64 / 3
        {"clock flicker=10ppb", adev1, 10, 0.8},
        {"clock flicker=10ppb", adev64, 10, 1.5}};
    for (const auto& row : kRows)
        EXPECT_NEAR(row.expected, row.figure(pairsOf(row.text)), row.tolerance) << row.text;
}

TEST(Scenario, leavesTheNoiseOfOneCauseAloneWhenItChangesAnother)
{
    const char* const noisy = "reference noise=50ns delay=9ns flicker=5ns delayed=5% size=1us\n"
                              "clock white=1ppb wander=1ppb flicker=1ppb\n";
    const tPairs plain = pairsOf(noisy);
    for (const char* const more : {"at 500s silence\nat 510s resume", "reference missing=1%"}) {
        const tPairs other = pairsOf(std::string(noisy) + more);
        EXPECT_LT(other.size(), plain.size());
        EXPECT_EQ(plain.back().errorNs(), other.back().errorNs()) << more;
    }
}

// On every machine: errors as measured, in ns, and true ones.
TEST(Scenario, isTheSameEverywhere)
{
    const tPairs pairs = pairsOf(
        "clock offset=-3ms frequency=12ppm white=3ppb wander=2ppb flicker=4ppb ramp=-1ppb\n"
        "clock sine=50ppb period=700s\nreference noise=50ns flicker=7ns delay=9ns size=1us\n"
        "reference interval=250ms delayed=5% outliers=3% granularity=8ns missing=2%\n"
        "at 300s jump -5us\nat 400s clock frequency=3ppb\nat 2000s reference noise=0ns\n");
    std::string found;
    for (const size_t at : {0, 1, 2, 20, 200, 1300, 1900, 9000})
        found += fmt::format("{} {:.9g}; ", pairs.at(at).errorNs(), *pairs.at(at).trueErrorNs);
    EXPECT_EQ(
        "-2999992 -3000000; -2996976 -2996998.25; -2994040 -2993997.42; -2930032 -2931039.53; "
        "-2388720 -2388698.67; 942824 942871.406; 2727984 2727925.83; 21949144 21949181.2; ",
        found);
}

TEST(Scenario, keepsEachQuantityWithinItsBounds)
{
    const struct {
        const char *before, *below, *lowest, *highest, *above;
    } kRows[] = {{"clock offset=", "-438300.1h", "-438300h", "438300h", "438300.1h"},
                 {"clock frequency=", "-100001ppm", "-100000ppm", "100000ppm", "100001ppm"},
                 {"clock white=", "-1e-9ppb", "0ppb", "1000ppm", "1001ppm"},
                 {"clock wander=", "-1e-9ppb", "0ppb", "1000ppm", "1001ppm"},
                 {"clock flicker=", "-1e-9ppb", "0ppb", "1000ppm", "1001ppm"},
                 {"clock period=1s sine=", "-1e-9ppb", "0ppb", "1000ppm", "1001ppm"},
                 {"clock period=", "0.9ns", "1ns", "438300h", "438300.1h"},
                 {"clock ramp=", "-1001ppb", "-1000ppb", "1000ppb", "1001ppb"},
                 {"reference interval=", "0.9ns", "1ns", "24h", "24.1h"},
                 {"reference noise=", "-1e-9ns", "0ns", "24h", "24.1h"},
                 {"reference flicker=", "-1e-9ns", "0ns", "24h", "24.1h"},
                 {"reference outliers=", "-1e-9%", "0%", "100%", "101%"},
                 {"reference delayed=", "-1e-9%", "0%", "100%", "101%"},
                 {"reference size=", "-1e-9ns", "0ns", "24h", "24.1h"},
                 {"reference delay=", "-1e-9ns", "0ns", "24h", "24.1h"},
                 {"reference granularity=", "0.9ns", "1ns", "24h", "24.1h"},
                 {"reference missing=", "-1e-9%", "0%", "100%", "101%"},
                 {"at 1s jump ", "-24.1h", "-24h", "24h", "24.1h"},
                 {"at 1ns silence\nat ", "0.9ns resume", "1ns resume", "438300h resume",
                  "438300.1h resume"}};
    for (const auto& row : kRows) {
        for (const char* const value : {row.below, row.lowest, row.highest, row.above}) {
            const std::string text = std::string(row.before) + value;
            const bool within = value == row.lowest || value == row.highest;
            const std::string why = failureOf([&] { parseScenario(text, "it", {}); });
            EXPECT_EQ(within, why.empty()) << text << why;
            EXPECT_EQ(within, why.find("out of range") == why.npos) << text << why;
        }
    }
    const tScenarioStart start{{}, true};
    EXPECT_EQ("it:1: interval: given by an option as well",
              failureOf([&] { parseScenario("reference interval=1s", "it", start); }));
}

TEST(Scenario, isRefusedByNameAndLine)
{
    for (const auto& [text, why] :
         {std::pair<const char*, const char*>{
              "# fine\n\nclok offset=1s", "it:3: unknown statement 'clok'; did you mean clock?"},
          {"clock", "it:1: lacks KEY=VALUE"},
          {"clock white=1ppb wander", "it:1: 'wander' is no KEY=VALUE"},
          {"reference wander=1ppb", "it:1: unknown key 'wander'"},
          {"clock whit=1ppb", "it:1: unknown key 'whit'; did you mean white?"},
          {"clock white=1s", "it:1: '1s' has an unknown unit 's'; use ppb or ppm"},
          {"reference noise=-1ns", "it:1: noise: '-1ns' is out of range"},
          {"reference missing=101%", "it:1: missing: '101%' is out of range"},
          {"clock sine=1ppb", "it:1: sine lacks a period"},
          {"at 5s silence\nat 4s resume", "it:2: is before the statement above it"},
          {"at 5s silence\nclock white=1ppb", "it:2: comes after statements with a time"},
          {"at 0 silence", "it:1: at: '0' is out of range"},
          {"at 5s", "it:1: lacks what happens"},
          {"at 5s explode", "it:1: unknown event 'explode'"},
          {"at 5s silence 9s", "it:1: has '9s' too much"}})
        EXPECT_EQ(why, failureOf([script = text] { pairsOf(script); })) << text;
}

TEST(SameBits, agreesWithTheCLibrary)
{
    for (int i = -130; i < 130; ++i)
        EXPECT_NEAR(std::sin(std::acos(-1.0) * i / 50), sineOfTurns(i / 100.0), 1e-14);
}

} // namespace
