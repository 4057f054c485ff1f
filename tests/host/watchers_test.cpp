#include "host/stepFixture.h"
#include "watchers/tMetricsFile.h"
#include "watchers/tReport.h"
#include "watchers/tStatusLines.h"
#include "watchers/tSummary.h"
#include "watchers/tTraceFile.h"

#include <fmt/format.h>

#include <functional>
#include <regex>
#include <stdexcept>
#include <stdio_ext.h>
#include <sys/stat.h>

using namespace dravikHost;

namespace {

// What a person reads on stdout.
std::string shownBy(const std::function<void(tConsole&)>& watch)
{
    testing::internal::CaptureStdout();
    tConsole console(false);
    watch(console);
    __fpurge(stdout); // what was not flushed is not shown while it happens
    return testing::internal::GetCapturedStdout();
}

tStep withEvent(tStep step, tLockEvent event, tHostCalls calls = {})
{
    step.event = event;
    step.calls = std::move(calls);
    return step;
}

tStep failed(tStep step)
{
    step.failure = std::make_exception_ptr(std::runtime_error("the clock is gone"));
    return step;
}

tStep held(tStep step)
{
    step.heldBack = true;
    return step;
}

TEST(Report, saysWhatHappens)
{
    struct tRow {
        tLockEvent event;
        tHostCalls calls;
        const char* text;
    };
    const tRow rows[] = {
        {kNothingNew, {{kSetFrequency, -3}}, ""},
        {kFrequencyMeasured,
         {{kGetFrequency, 1500}, {kSetFrequency, -20000}},
         "     2.500 s  frequency measured: +21.500 ppm off, now steered by -20.000 ppm\n"},
        {kFrequencyAtLimit,
         {{kSetFrequency, 500000}},
         "     2.500 s  frequency at its limit, +500.000 ppm\n"},
        {kStepped, {{kStepTime, -3000000}}, "     2.500 s  stepped by -3 ms\n"},
        {kNotStepped, {}, "     2.500 s  no step needed, error +120 ns\n"},
        {kLockGained, {{kSetFrequency, 7}}, "     2.500 s  locked, error +120 ns\n"},
        {kLockMissed, {}, "     2.500 s  lock missed, error +120 ns\n"},
        {kLockLost, {}, "     2.500 s  lock lost, error +120 ns\n"},
    };
    for (const tRow& row : rows) {
        const tStep step = withEvent(stepAt(2.5, 120, false, 0), row.event, row.calls);
        EXPECT_EQ(row.text, shownBy([&](tConsole& console) { tReport(console).see(step); }));
        EXPECT_EQ("", shownBy([&](tConsole& console) { tReport(console).see(failed(step)); }));
    }
    EXPECT_EQ("run: clock soft\n"
              "     1.000 s  tuned by quiet.json\n"
              "    70.250 s  documents read again\n"
              "left out: 3\n",
              shownBy([](tConsole& console) {
                  tReport report(console);
                  report.begin("run: clock soft", {});
                  tStep step = stepAt(1, -7, true, 0);
                  step.tuning = "tuned by quiet.json";
                  report.see(step);
                  report.see(tSilence{nsOfSeconds(2), nsOfSeconds(1), 5.0});
                  report.note(nsOfSeconds(70.25), "documents read again");
                  report.end("");
                  report.end("left out: 3");
              }));
}

tStep stepped(double seconds, int64_t errorNs, int64_t stepNs)
{
    tStep step = stepAt(seconds, errorNs, false, -20000);
    step.stepNs = stepNs;
    return step;
}

TEST(StatusLines, tellEachPair)
{
    EXPECT_EQ("dravik-host[1.000]: offset    3000000 s0 freq  +20000\n"
              "dravik-host[2.000]: offset    3000000 s1 freq  +20000\n"
              "dravik-host[3.500]: offset        -23 s2 freq    -450\n"
              "dravik-host[14.000]: holdover for 10.5 s, error about 34 ns\n"
              "dravik-host[15.000]: holdover for 11.5 s, error unknown\n",
              shownBy([](tConsole& console) {
                  tStatusLines status(0, console);
                  status.see(stepAt(1, 3000000, false, -20000));
                  status.see(stepped(2, 3000000, -3000000));
                  status.see(stepAt(3.5, -23, true, 450));
                  status.see(failed(stepAt(4, 0, true, 450)));
                  status.see(tSilence{nsOfSeconds(4.1), {}, {}}); // not a holdover yet
                  status.see(tSilence{nsOfSeconds(14), nsOfSeconds(10.5), 34.0});
                  status.see(tSilence{nsOfSeconds(14.9), nsOfSeconds(11.4), {}});
                  status.see(tSilence{nsOfSeconds(15), nsOfSeconds(11.5), {}});
              }));
}

TEST(StatusLines, tellStretches)
{
    EXPECT_EQ("dravik-host[3.000]: rms   30 max   50 freq  -10001 +/-   1\n"
              "dravik-host[5.000]: rms    7 max    7 freq    +500 +/-   0\n"
              "dravik-host[8.000]: holdover for 3 s, error unknown\n",
              shownBy([](tConsole& console) {
                  tStatusLines status(nsOfSeconds(2), console);
                  status.see(stepAt(1, 10, true, 10000)); // rms: the root of (100+2500+100)/3
                  status.see(stepAt(2, -50, true, 10001));
                  status.see(stepAt(3, 10, true, 10002));
                  status.see(stepAt(4, 7, true, -500));
                  status.see(failed(stepAt(5, 9000, true, 0)));
                  status.see(stepAt(5, 7, true, -500));
                  status.see(tSilence{nsOfSeconds(6.9), nsOfSeconds(1.9), {}}); // too soon
                  status.see(tSilence{nsOfSeconds(8), nsOfSeconds(3), {}});
              }));
    EXPECT_EQ("", shownBy([](tConsole& console) {
                  tStatusLines status({}, console);
                  status.see(stepAt(0, 10, true, 10000));
                  status.see(tSilence{nsOfSeconds(20), nsOfSeconds(20), {}});
              }));
}

TEST(MetricsFile, exportsEveryFigureOnceASecond)
{
    const tTestFile file("metrics");
    tConsole console(false);
    tMetricsFile metrics(file.path, console);
    const auto samples = [&file] {
        return std::regex_replace(readText(file.path), std::regex("#.*\n|dravik_"), "");
    };
    const auto with = [](const char* offset, const char* holdover, const char* pairs) {
        return std::string("offset_seconds ") + offset + "\nfrequency_offset -3.5e-06\nlocked 1\n" +
               "holdover_seconds " + holdover + "\npairs_total " + pairs +
               "\nlocks_lost_total 3\nsteps_total 5\n";
    };
    tStep step = stepAt(1, -4000000, true, -3500);
    step.steps = 5;
    step.locksLost = 3;
    metrics.see(step);
    EXPECT_EQ(with("-0.004", "0\nestimated_error_seconds 0", "1"), samples());
    EXPECT_EQ(0U, readText(file.path).find("# HELP dravik_offset_seconds Clock minus reference, as "
                                           "measured last.\n# TYPE dravik_offset_seconds gauge\n"
                                           "dravik_offset_seconds -0.004\n"));
    metrics.see(held(step)); // is not handed to the servo
    step.pair = pairAt(1.999, 250);
    metrics.see(step);
    metrics.see(failed(stepAt(2, 9, false, 0)));
    EXPECT_EQ(with("-0.004", "0\nestimated_error_seconds 0", "1"), samples()); // too soon for more
    metrics.see(tSilence{nsOfSeconds(2), {}, {}});
    EXPECT_EQ(with("2.5e-07", "0\nestimated_error_seconds 0", "2"), samples());
    metrics.see(tSilence{nsOfSeconds(14), nsOfSeconds(12), 340.0});
    EXPECT_EQ(with("2.5e-07", "12\nestimated_error_seconds 3.4e-07", "2"), samples());
    metrics.see(tSilence{nsOfSeconds(15), nsOfSeconds(13), {}});
    EXPECT_EQ(with("2.5e-07", "13\nestimated_error_seconds nan", "2"), samples());
    metrics.see(stepAt(17, 0, false, 0));
    EXPECT_NE(std::string::npos, samples().find("locked 0\nholdover_seconds 0\n"));
}

TEST(MetricsFile, failsAtTheFirstFileOnly)
{
    tConsole console(false);
    tMetricsFile nowhere("/no/such/folder/metrics", console);
    EXPECT_THROW(nowhere.see(stepAt(0, 0, false, 0)), std::runtime_error);
    tMetricsFile("", console).see(stepAt(0, 0, false, 0)); // none is asked for

    const tTestFile file("metrics");
    const std::string inTheWay = file.path + ".new"; // where the next file is drafted
    const std::string text = shownBy([&](tConsole& shown) {
        tMetricsFile metrics(file.path, shown);
        const auto seeTwice = [&metrics](double seconds) {
            metrics.see(stepAt(seconds, 0, false, 0));
            metrics.see(stepAt(seconds + 1, 0, false, 0));
        };
        seeTwice(0);
        for (const double seconds : {2, 6}) {
            mkdir(inTheWay.c_str(), 0700);
            seeTwice(seconds);
            rmdir(inTheWay.c_str());
            seeTwice(seconds + 2);
        }
    });
    const std::string reason = " s  cannot write " + inTheWay + ": Is a directory\n";
    EXPECT_EQ("     2.000" + reason + "     6.000" + reason, text);
}

TEST(Summary, countsWhatHappened)
{
    struct tRow {
        std::optional<double> trueErrorNs;
        int64_t locksLost;
        const char* lost;
        const char* error;
        const char* against;
    };
    const tRow rows[] = {
        {{}, 2, "2 times", "34.16 ns, peak 50 ns, last +10 ns", "reference as measured"},
        {-2.5, 1, "1 time", "2.5 ns, peak 2.5 ns, last -2.5 ns", "true time"},
    };
    for (const tRow& row : rows) {
        const auto watch = [&row](tConsole& console) {
            tSummary summary(console);
            summary.begin("", {{kGetMaxFrequencyOffset, 5}, {kSetFrequency, 1000}});
            summary.see(withEvent(stepAt(0, 900, false, 0), kNothingNew, {{kGetTime, 1}}));
            summary.see(held(stepAt(1, 800, true, 0)));
            summary.see(withEvent(stepAt(2, 0, false, 0), kNothingNew, {{kSetFrequency, -9000}}));
            double atS = 3.5;
            for (const int64_t errorNs : {30, -50, 10, 9000}) {
                tStep step =
                    stepAt(atS++, errorNs, errorNs != 9000, 0); // out of the lock in the end
                if (step.locked) step.calls = {{kGetFrequency, 0}, {kSetFrequency, 30 * errorNs}};
                step.pair.trueErrorNs = row.trueErrorNs;
                step.locksLost = row.locksLost;
                step.steps = 7;
                summary.see(step);
            }
            summary.end("");
        };
        EXPECT_EQ(fmt::format("pairs       7 in 6.500 s; 1 held back\n"
                              "lock        after 3.500 s, lost {}; 3 pairs locked\n"
                              "error       RMS {}\n            (of the clock against the {}, while "
                              "locked)\n"
                              "frequency   ordered -9.000 ppm to +1.000 ppm, last +0.300 ppm\n"
                              "host calls  getTime 1, stepTime 0, getFrequency 3, setFrequency 5,\n"
                              "            getMaxFrequencyOffset 1, getMinFrequencyOffset 0\n",
                              row.lost, row.error, row.against),
                  shownBy(watch));
    }
    tConsole console(false);
    EXPECT_EQ(0U, tSummary(console).text().find("pairs       0 in 0.000 s\nlock        never\n"
                                                "frequency   never ordered\n"));
}

TEST(TraceFile, holdsPairsAndCallsInOrder)
{
    const tHostCalls calls = {{kGetFrequency, 7}, {kSetFrequency, -20000}, {kStepTime, -3}};
    for (const bool dryRun : {false, true}) {
        const tTestFile file("trace.csv");
        tTraceFile trace(file.path, dryRun);
        trace.begin("", {{kGetMaxFrequencyOffset, 5}});
        tStep step = withEvent(stepAt(1.25, -40, true, 0), kNothingNew, calls);
        step.pair.trueErrorNs = -38.0625;
        trace.see(step);
        trace.see(failed(stepAt(2, 5, true, 0))); // is on the disk before the end
        const std::string order = dryRun ? "held,1.250000000,,,,," : "call,1.250000000,,,,,";
        const std::string expected =
            "kind,elapsed_s,reference_ns,clock_ns,error_ns,true_error_ns,call,value\n"
            "call,0.000000000,,,,,getMaxFrequencyOffset,5\n"
            "pair,1.250000000,1700000001250000000,1700000001249999960,-40,-38.062,,\n"
            "call,1.250000000,,,,,getFrequency,7\n" +
            order + "setFrequency,-20000\n" + order + "stepTime,-3\n" +
            "pair,2.000000000,1700000002000000000,1700000002000000005,5,,,\n";
        EXPECT_EQ(expected, readText(file.path));
        trace.see(held(stepAt(3, 6, true, 0)));
        trace.end("");
        EXPECT_EQ(expected + "pair,3.000000000,1700000003000000000,1700000003000000006,6,,,\n",
                  readText(file.path));
    }
}

} // namespace
