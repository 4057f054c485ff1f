#include "clocks/openClock.h"
#include "clocks/systemTime.h"
#include "clocks/tGuardedClock.h"
#include "clocks/tKernelClock.h"
#include "clocks/tPtpDevice.h"
#include "clocks/tRecordedClock.h"
#include "clocks/tSoftClock.h"
#include "clocks/tSteeredClock.h"
#include "host/stepFixture.h"

#include <array>
#include <cerrno>
#include <cstdarg>
#include <linux/ptp_clock.h>
#include <sys/ioctl.h>
#include <system_error>
#include <vector>

using namespace dravikHost;

namespace {

// What the program asks of the kernel's clocks, in place of the kernel.
struct tKernel {
    std::vector<timex> requests;
    long frequency = 0; // in force
    long highest = 32'768'000;
    int failure = 0;
};
tKernel kernel;

// What a PTP clock answers. Its sample i begins at i s and takes 99 ns, the sixth one 6 ns.
struct tDevice {
    unsigned methods = 0; // that it knows: 3, or the simplest ones
    int failure = ENOTTY;
};
tDevice device;

ptp_clock_time ptpTime(size_t sample, uint32_t ns)
{
    return {static_cast<int64_t>(sample), sample == 5 && ns == 99 ? 6 : ns, 0};
}

} // namespace

extern "C" int ioctl(int /*fd*/, unsigned long request, ...) noexcept
{
    va_list arguments;
    va_start(arguments, request);
    void* const reply = va_arg(arguments, void*);
    va_end(arguments);
    errno = device.failure;
    if (request == PTP_CLOCK_GETCAPS && device.methods > 0) {
        static_cast<ptp_clock_caps*>(reply)->max_adj = 700;
    } else if (request == PTP_SYS_OFFSET_PRECISE && device.methods == 3) {
        auto* const precise = static_cast<ptp_sys_offset_precise*>(reply);
        precise->sys_realtime = ptpTime(3, 30);
        precise->device = ptpTime(4, 40);
    } else if (request == PTP_SYS_OFFSET_EXTENDED && device.methods >= 2) {
        auto* const extended = static_cast<ptp_sys_offset_extended*>(reply);
        for (size_t i = 0; i < extended->n_samples; ++i) {
            for (const size_t k : {0, 1, 2})
                extended->ts[i][k] = ptpTime(i, std::array{0U, 1000U, 99U}[k]);
        }
    } else if (request == PTP_SYS_OFFSET && device.methods >= 1) {
        auto* const basic = static_cast<ptp_sys_offset*>(reply);
        for (size_t i = 0; i < basic->n_samples; ++i) { // a sample ends where the next one begins
            basic->ts[2 * i] = {static_cast<int64_t>(i), i == 5 ? 999'999'994U : 0, 0};
            basic->ts[2 * i + 1] = ptpTime(i, 1000);
        }
        basic->ts[size_t{2} * basic->n_samples] = ptpTime(basic->n_samples, 0);
    } else {
        return -1;
    }
    return 0;
}

// The C library's own one is never reached: no clock of the machine is touched here.
extern "C" int clock_adjtime(clockid_t /*id*/, timex* request) noexcept
{
    kernel.requests.push_back(*request);
    if (kernel.failure != 0) {
        errno = kernel.failure;
        return -1;
    }
    if ((request->modes & ADJ_FREQUENCY) != 0)
        kernel.frequency = std::min(request->freq, kernel.highest);
    request->freq = kernel.frequency;
    request->tolerance = kernel.highest;
    return 0;
}

namespace {

constexpr uint64_t kStart = 1'700'000'000'000'000'000;
constexpr int64_t kSecond = 1'000'000'000;

TEST(SteeredClock, passesWhatOscillatorAndOrderSay)
{
    const struct {
        double oscillatorPpb;
        int32_t orderedPpb;
        double aheadNs; // after ten seconds
        uint64_t shownNs;
    } kRows[] = {{0, 0, 0, 10'000'000'000},      {120, 0, 1200, 10'000'001'200},
                 {0, 120, 1200, 10'000'001'200}, {0, -7, -70, 9'999'999'930},
                 {-7, 5, -20, 9'999'999'980},    {1e8, 100'000'000, 2.1e9, 12'100'000'000},
                 {-1e9, 100'000'000, -1e10, 0}};
    for (const auto& row : kRows) {
        tSteeredClock clock(kStart, row.oscillatorPpb, 200'000'000);
        clock.setOffsetPpb(row.orderedPpb);
        clock.pass(10 * kSecond);
        EXPECT_NEAR(row.aheadNs, clock.aheadOfNs(kStart + 10 * kSecond), 1e-5);
        EXPECT_NEAR(row.shownNs, clock.timeNs() - kStart, 1) << row.aheadNs;
    }
}

TEST(SteeredClock, showsTheNanosecondThatItIsIn)
{
    tSteeredClock clock(kStart, -0.25, 0);
    clock.pass(10 * kSecond);
    EXPECT_EQ(kStart + 9'999'999'997, clock.timeNs());
}

TEST(SteeredClock, keepsItsFractionsOverYears)
{
    tSteeredClock clock(kStart, 1e-4, 0);
    const int64_t hourNs = 3600 * kSecond + 1;
    for (int hour = 0; hour < 87'600; ++hour)
        clock.pass(hourNs);
    EXPECT_NEAR(31'536, clock.aheadOfNs(kStart + uint64_t{87'600} * hourNs), 1e-4);
}

TEST(SteeredClock, isSteppedAndKeepsToItsLimits)
{
    tSteeredClock clock(kStart, 0, 500);
    clock.step(-3);
    EXPECT_EQ(kStart - 3, clock.timeNs());
    clock.step(5);
    EXPECT_EQ(kStart + 2, clock.timeNs());
    for (const int32_t offsetPpb : {500, -500}) {
        clock.setOffsetPpb(offsetPpb);
        EXPECT_THROW(clock.setOffsetPpb(501), std::out_of_range);
        EXPECT_THROW(clock.setOffsetPpb(-501), std::out_of_range);
        EXPECT_EQ(offsetPpb, clock.offsetPpb());
    }
    EXPECT_EQ(500, clock.maxOffsetPpb());
    EXPECT_EQ(-500, clock.minOffsetPpb());
}

TEST(SimulatedClock, isAsNoisyAsItsModelSays)
{
    const struct {
        tOscillatorModel model;
        double phase, wander; // ns per first and ns/s per second number, in four seconds
    } kRows[] = {{{}, 0, 0}, {{0, 10, 0}, 20, 0}, {{0, 0, 5}, 0, 10}};
    for (const auto& row : kRows) {
        tNoise noise(3);
        tNoise same(3);
        tSimulatedClock clock(kStart, row.model, 1000, noise);
        clock.advance(4 * kSecond);
        const double phaseNs = row.phase * same.normal();
        const double wanderPpb = row.wander * same.normal();
        EXPECT_NEAR(phaseNs, clock.aheadOfNs(kStart + 4 * kSecond), 1e-6);
        const double before = clock.aheadOfNs(kStart + 4 * kSecond);
        clock.advance(kSecond);
        const double whiteNs = row.phase / 2 * same.normal();
        EXPECT_NEAR(before + whiteNs + wanderPpb, clock.aheadOfNs(kStart + 5 * kSecond), 1e-6);
        same.normal();
        EXPECT_EQ(same.normal(), noise.normal()); // as many numbers at every level
    }
}

TEST(RecordedClock, showsWhatWasRecorded)
{
    tRecordedClock clock(100);
    clock.showTime(kStart);
    clock.step(5);
    EXPECT_EQ(kStart, clock.timeNs());
    for (const auto& [recordedPpb, shownPpb] :
         {std::pair(12.5, 12.5), {-0.25, -0.25}, {1e12, 100}, {-1e12, -100}}) {
        clock.showOffset(recordedPpb);
        EXPECT_EQ(shownPpb, clock.offsetPpb());
    }
    EXPECT_EQ(100, clock.maxOffsetPpb());
    EXPECT_EQ(-100, clock.minOffsetPpb());
}

TEST(GuardedClock, asksItsGuardAndHoldsBackInADryRun)
{
    const auto guard = [](int64_t deltaNs) {
        if (deltaNs == 13) throw std::runtime_error("refused");
    };
    for (const bool dryRun : {false, true}) {
        tSteeredClock clock(kStart, 0, 500);
        tGuardedClock guarded(clock, guard, dryRun);
        EXPECT_THROW(guarded.step(13), std::runtime_error);
        guarded.step(10);
        guarded.setOffsetPpb(20);
        EXPECT_EQ(kStart + (dryRun ? 0 : 10), guarded.timeNs());
        EXPECT_EQ(dryRun ? 0 : 20, guarded.offsetPpb());
        EXPECT_EQ(500, guarded.maxOffsetPpb());
        EXPECT_EQ(-500, guarded.minOffsetPpb());
    }
}

// An oscillator that is slow by everything stands still, whatever time passes.
TEST(SoftClock, passesTheTimeOfItsOscillator)
{
    tSoftClock still(kStart, -1e9, 500);
    still.step(-4);
    const tCrossReading reading = still.crossRead();
    EXPECT_LE(reading.systemNs, systemTimeNs(CLOCK_REALTIME));
    EXPECT_EQ(kStart - 4, reading.clockNs);
    EXPECT_THROW(still.setOffsetPpb(501), std::out_of_range);
}

TEST(SoftClock, ranAtTheOldRateUntilItIsOrderedAnother)
{
    constexpr uint64_t kPassedNs = 1'000'000;
    const uint64_t rawNs = rawTimeNs();
    tSoftClock clock(kStart, 0, 1'000'000'000);
    const uint64_t startedNs = rawTimeNs();
    while (rawTimeNs() - startedNs < kPassedNs)
        clock.timeNs();
    while (rawTimeNs() - startedNs < 2 * kPassedNs) {
    }
    clock.setOffsetPpb(-1'000'000'000); // which stops it
    EXPECT_EQ(-1'000'000'000, clock.offsetPpb());
    const uint64_t stoppedNs = clock.timeNs();
    EXPECT_GE(stoppedNs, kStart + 2 * kPassedNs);
    EXPECT_LE(stoppedNs, kStart + (rawTimeNs() - rawNs));
    EXPECT_EQ(stoppedNs, clock.timeNs());
}

TEST(SystemTime, ofOneClockIsTheMiddleOfAWindow)
{
    const uint64_t beforeNs = rawTimeNs();
    const tCrossReading reading = crossReadSystem(CLOCK_MONOTONIC_RAW);
    EXPECT_GE(reading.clockNs - reading.windowNs / 2, beforeNs);
    EXPECT_LE(reading.clockNs + reading.windowNs / 2, rawTimeNs());
    EXPECT_THROW(systemTimeNs(1000), std::system_error);
}

TEST(KernelFrequency, givesBackWhatWasSet)
{
    for (const auto& [ppb, units] : {std::pair(0.0, 0L),
                                     {1, 66},
                                     {-1, -66},
                                     {1.0 / 64, 1},
                                     {0.0229, 2},
                                     {0.0228, 1},
                                     {500'000, 32'768'000},
                                     {-100'000, -6'553'600}})
        EXPECT_EQ(units, kernelFrequency(ppb)) << ppb;
    EXPECT_DOUBLE_EQ(0.5, ppbOfKernelFrequency(32'768) / 1000);
    for (const int32_t finest : {1, 2, 3, 31, 32, 7 * 64, 31'999'999, 2'097'151'999}) {
        const double ppb = finest / 64.0;
        if (sizeof(long) == 4 && ppb > 32'767'999) continue;
        EXPECT_EQ(finest, std::lround(64 * ppbOfKernelFrequency(kernelFrequency(ppb))));
        EXPECT_EQ(-finest, std::lround(64 * ppbOfKernelFrequency(kernelFrequency(-ppb))));
    }
}

TEST(PtpDevice, isReadInTheMostExactWayThatItKnows)
{
    const tTestFile file("ptp", "");
    const struct {
        unsigned methods;
        const char* method;
        tCrossReading reading; // of the shortest window, the middle
    } kRows[] = {{3, "PTP_SYS_OFFSET_PRECISE", {3'000'000'030, 4'000'000'040, 0}},
                 {2, "PTP_SYS_OFFSET_EXTENDED", {5'000'000'003, 5'000'001'000, 6}},
                 {1, "PTP_SYS_OFFSET", {5'999'999'997, 5'000'001'000, 6}}};
    for (const auto& row : kRows) {
        for (const int failure : {EOPNOTSUPP, ENOTTY, EINVAL}) {
            device = {row.methods, failure};
            tPtpDevice ptp(file.path);
            EXPECT_EQ(700, ptp.maxOffsetPpb());
            const tCrossReading reading = ptp.crossRead();
            EXPECT_STREQ(row.method, ptp.method());
            EXPECT_EQ(row.reading.systemNs, reading.systemNs);
            EXPECT_EQ(row.reading.clockNs, reading.clockNs);
            EXPECT_EQ(row.reading.windowNs, reading.windowNs);
            device.methods = 0;
            const std::string why = failureOf([&] { ptp.crossRead(); });
            EXPECT_EQ(0U, why.find("cannot read " + file.path)) << why;
            EXPECT_STREQ("PTP_SYS_OFFSET", ptp.method());
        }
    }
    EXPECT_EQ(0U, failureOf([&] { tPtpDevice(file.path); }).find(file.path + " is not a PTP clo"));
    EXPECT_EQ(0U, failureOf([] { tPtpDevice("/no/ptp"); }).find("cannot open /no/ptp"));
    device = {3, EOPNOTSUPP};
    tPtpDevice ptp(file.path);
    device = {1, EIO};
    EXPECT_NE("", failureOf([&] { ptp.crossRead(); })); // which is not for want of a method
    EXPECT_STREQ("PTP_SYS_OFFSET_PRECISE", ptp.method());
    device = {};
}

class KernelClock : public testing::Test
{
protected:
    KernelClock() { kernel = tKernel(); }

    tKernelClock clock{CLOCK_REALTIME, "the clock", 600'000, readSystemItself};
};

TEST_F(KernelClock, isSteppedBySecondsAndNanoseconds)
{
    for (const auto& [deltaNs, seconds, nanoseconds] : {std::tuple<int64_t, long, long>{1, 0, 1},
                                                        {-1, -1, 999'999'999},
                                                        {-kSecond, -1, 0},
                                                        {kSecond, 1, 0},
                                                        {2'500'000'000, 2, 500'000'000},
                                                        {-2'500'000'000, -3, 500'000'000}}) {
        clock.step(deltaNs);
        const timex& request = kernel.requests.back();
        EXPECT_EQ(unsigned{ADJ_SETOFFSET | ADJ_NANO}, request.modes);
        EXPECT_EQ(seconds, request.time.tv_sec) << deltaNs;
        EXPECT_EQ(nanoseconds, request.time.tv_usec) << deltaNs;
    }
}

TEST_F(KernelClock, refusesAnOffsetThatIsNotTaken)
{
    clock.setOffsetPpb(-500'000);
    EXPECT_EQ(unsigned{ADJ_FREQUENCY}, kernel.requests[0].modes);
    EXPECT_EQ(-32'768'000, kernel.frequency);
    EXPECT_EQ(-500'000, clock.offsetPpb());
    EXPECT_EQ(0U, kernel.requests.back().modes); // only looked at
    clock.setOffsetPpb(-0.02);
    EXPECT_DOUBLE_EQ(-1 / 65.536, clock.offsetPpb()); // what was taken
    EXPECT_THROW(clock.setOffsetPpb(500'001), std::out_of_range);
    EXPECT_EQ(600'000, clock.maxOffsetPpb());
    EXPECT_EQ(-600'000, clock.minOffsetPpb());
}

TEST_F(KernelClock, saysWhatItLacks)
{
    kernel.failure = EPERM;
    EXPECT_EQ("cannot step the clock, which takes CAP_SYS_TIME: Operation not permitted",
              failureOf([&] { clock.step(1); }));
    tKernelClock device{-5, "it", 1, readSystemItself};
    EXPECT_EQ("cannot step it: Operation not permitted", failureOf([&] { device.step(1); }));
    kernel.failure = EINVAL;
    EXPECT_EQ("cannot step the clock: Invalid argument", failureOf([&] { clock.step(1); }));
    EXPECT_THROW(openClock({"realtime", 1}), std::system_error);
}

TEST_F(KernelClock, isOpenedByName)
{
    for (const char* const name : {"soft", "realtime", "phc:/dev/ptp0"})
        EXPECT_TRUE(isClockName(name)) << name;
    for (const char* const name : {"", "phc:", "Soft", "realtime2", "monotonic"})
        EXPECT_FALSE(isClockName(name)) << name;
    EXPECT_EQ(500'000, openClock({"realtime", 600'000})->maxOffsetPpb()); // the kernel's
    EXPECT_EQ(400'000, openClock({"realtime", 400'000})->maxOffsetPpb());
    EXPECT_THROW(openClock({"phc:/no/device", 1}), std::system_error);
    EXPECT_THROW(openClock({"phc:/dev/null", 1}), std::system_error);
    const uint64_t beforeNs = systemTimeNs(CLOCK_REALTIME);
    const auto soft = openClock({"soft", 700, -3600 * kSecond, -1e9});
    EXPECT_GE(soft->timeNs() + 3600 * kSecond, beforeNs);
    EXPECT_EQ(soft->timeNs(), soft->timeNs()); // slow by all of it
    EXPECT_EQ(700, soft->maxOffsetPpb());
}

} // namespace
