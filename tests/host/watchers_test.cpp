#include "host/stepFixture.h"
#include "watchers/tMetricsFile.h"
#include "watchers/tReport.h"

#include <cstdlib>
#include <fcntl.h>
#include <functional>
#include <regex>
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

TEST(MetricsFile, exportsEveryFigureOnceASecond)
{
    const tTestFile file("metrics");
    tConsole console(false);
    tMetricsFile metrics(file.path, console);
    const auto expectSamples = [&file](const char* offset, const char* holdover,
                                       const char* pairs) {
        EXPECT_EQ(std::string("offset_seconds ") + offset +
                      "\nfrequency_offset -3.5e-06\nlocked 1\nholdover_seconds " + holdover +
                      "\npairs_total " + pairs +
                      "\nlocks_lost_total 3\nsteps_total 5\nsamples_out_of_date_total 2\n"
                      "samples_unusable_total 7\n",
                  std::regex_replace(readText(file.path), std::regex("#.*\n|dravik_"), ""));
    };
    metrics.see(tSilence{0, {}, {}}); // before the first pair
    EXPECT_NE(std::string::npos, readText(file.path).find("offset_seconds NaN\n"));
    EXPECT_NE(std::string::npos, readText(file.path).find("locked 0\n"));
    tStep step = stepAt(1, -4000000, true, -3500);
    step.steps = 5;
    step.locksLost = 3;
    step.leftOut = {2, 7};
    metrics.see(step);
    expectSamples("-0.004", "0\nestimated_error_seconds 0", "1");
    metrics.see(held(step)); // is not handed to the servo
    step.pair = pairAt(1.999, 250);
    metrics.see(step);
    metrics.see(failed(stepAt(2, 9, false, 0)));
    expectSamples("-0.004", "0\nestimated_error_seconds 0", "1"); // too soon for more
    metrics.see(tSilence{nsOfSeconds(2), {}, {}, {2, 7}});
    expectSamples("2.5e-07", "0\nestimated_error_seconds 0", "2");
    metrics.see(tSilence{nsOfSeconds(14), nsOfSeconds(12), 340.0, {2, 7}});
    expectSamples("2.5e-07", "12\nestimated_error_seconds 3.4e-07", "2");
    metrics.see(tSilence{nsOfSeconds(15), nsOfSeconds(13), {}, {2, 7}});
    expectSamples("2.5e-07", "13\nestimated_error_seconds NaN", "2");
    metrics.see(stepAt(15.5, 0, false, 0)); // too soon, but the last
    metrics.end("");
    EXPECT_NE(std::string::npos, readText(file.path).find("locked 0\n"));
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

// What a terminal gets of one step or silence: a line, and when the console goes, its end.
template <typename Moment> std::string progressOf(const Moment& moment)
{
    const tDescriptor terminal(posix_openpt(O_RDWR | O_NOCTTY));
    EXPECT_EQ(0, grantpt(terminal.get()) + unlockpt(terminal.get()));
    {
        const tDescriptor line(open(ptsname(terminal.get()), O_RDWR | O_NOCTTY));
        const tDescriptor before(dup(STDERR_FILENO));
        dup2(line.get(), STDERR_FILENO);
        {
            tConsole console(false);
            tReport(console).see(moment);
        }
        dup2(before.get(), STDERR_FILENO);
    }
    std::string text; // until all is read: it may come in pieces
    char piece[100];
    for (ssize_t size = 0; (size = read(terminal.get(), piece, sizeof piece)) > 0;)
        text.append(piece, static_cast<size_t>(size));
    return text;
}

TEST(Report, showsProgressOnATerminal)
{
    for (const auto& [found, text] :
         {std::pair(progressOf(stepAt(1, 250, true, 0)), "     1.000 s  locked, error +250 ns"),
          {progressOf(stepAt(12.5, -3000, false, 0)), "    12.500 s  not locked, error -3 us"},
          {progressOf(tSilence{nsOfSeconds(9), nsOfSeconds(4), 340.0}),
           "     9.000 s  holdover for 4 s, error about 340 ns"},
          {progressOf(tSilence{nsOfSeconds(9), nsOfSeconds(4)}),
           "     9.000 s  holdover for 4 s, error unknown"}})
        EXPECT_EQ("\r\x1b[K" + std::string(text) + "\r\x1b[K", found);
}

} // namespace
