// The servo core: time spans, the spike filter, the states, and the servo on a scripted clock.

#include "dravik/tServoStateFrequencyLock.h"
#include "dravik/tServoStatePhaseLock.h"
#include "support/allocator.h"
#include "support/tFakeHost.h"

#include <atomic>
#include <chrono>
#include <cmath>
#include <gtest/gtest.h>
#include <limits>
#include <sstream>
#include <thread>

namespace {

using zvckmDravik::tTimeSpan;

constexpr uint64_t kSecond = 1000000000U;
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

TEST(TimeSpan, FromAndToSeconds)
{
    for (const auto& [seconds, magnitude, sign] : {
             std::tuple<double, uint64_t, int32_t>{0.5, 500000000, 1},
             {-1.5, 1500000000, -1},
             {1e-6, 1000, 1},
             {1.5e-8, 14, 1},
             {-0.0, 0, 1},
             {kNaN, 0, -1},
             {1.9999999999, 1999999999, 1},
             {10.0, 10 * kSecond, 1},
             {kInfinity, 4294967295U * kSecond + 4294967295U, 1}, // both conversions saturate
         }) {
        const tTimeSpan span(seconds);
        EXPECT_EQ(magnitude, span.getMagnitude()) << seconds;
        EXPECT_EQ(sign, span.getSign()) << seconds;
    }
    EXPECT_EQ(-1.5, tTimeSpan(1500000000U, -1).toSeconds());
    EXPECT_EQ(0x1.9c511dc3a41dfp-29, tTimeSpan(uint64_t{3}).toSeconds())
        << "divided, not multiplied";
    EXPECT_TRUE(std::signbit(tTimeSpan(0U, -1).toSeconds()));
}

TEST(TimeSpan, PartsCarryAndKeepTheSign)
{
    tTimeSpan span(2 * kSecond + 5, -1);
    EXPECT_EQ(2U, span.getSeconds());
    EXPECT_EQ(5U, span.getNanoseconds());
    span.setNanoseconds(1500000000);
    EXPECT_EQ(3500000000U, span.getMagnitude());
    span.setSeconds(4294967295U);
    EXPECT_EQ(4294967295U * kSecond + 500000000U, span.getMagnitude());
    EXPECT_EQ(-1, span.getSign());
}

TEST(TimeSpan, DifferencesWrapAndComparisonsLookAtTheSignFirst)
{
    const uint64_t big = uint64_t{1} << 63;
    const struct {
        tTimeSpan a, b;
        int64_t difference;
        bool greater, greaterOrEqual;
    } rows[] = {{tTimeSpan(uint64_t{5}), tTimeSpan(uint64_t{7}), -2, false, false},
                {tTimeSpan(uint64_t{7}), tTimeSpan(uint64_t{7}), 0, false, true},
                {tTimeSpan(3U, -1), tTimeSpan(5U, -1), 2, true, true},
                {tTimeSpan(5U, -1), tTimeSpan(3U, -1), -2, false, false},
                {tTimeSpan(5U, -1), tTimeSpan(5U, -1), 0, false, true},
                {tTimeSpan(uint64_t{1}), tTimeSpan(9U, -1), 10, true, true},
                {tTimeSpan(9U, -1), tTimeSpan(uint64_t{1}), -10, false, false},
                {tTimeSpan(1U, -1), tTimeSpan(uint64_t{9}), -10, false, false},
                {tTimeSpan(uint64_t{0}), tTimeSpan(0U, -1), 0, true, true},
                {tTimeSpan(0U, -1), tTimeSpan(uint64_t{0}), 0, false, false},
                {tTimeSpan(big + 3), tTimeSpan(big - 4), 7, true, true},
                {tTimeSpan(uint64_t{2}), tTimeSpan(UINT64_MAX), 3, false, false},
                {tTimeSpan(big), tTimeSpan(uint64_t{0}), INT64_MIN, true, true}};
    for (const auto& row : rows) {
        SCOPED_TRACE(testing::Message() << "row " << &row - rows);
        const tTimeSpan difference = row.a - row.b;
        EXPECT_EQ(row.difference, difference.toNanoseconds());
        EXPECT_EQ(row.difference < 0 ? -1 : 1, difference.getSign());
        EXPECT_EQ(row.greater, row.a > row.b);
        EXPECT_EQ(row.greaterOrEqual, row.a >= row.b);
    }
    EXPECT_EQ(big, tTimeSpan(INT64_MIN).getMagnitude());
}

// A filter of its own, on the parameters of a servo.
struct tFilterBench {
    tFilterBench() : config(host.open().config()), filter(config)
    {
        config.setSpikeFilterEnabled(true);
    }

    tFakeHost host;
    zvckmDravik::iServoConfig& config;
    zvckmDravik::tSpikeFilter filter;
};

TEST(SpikeFilter, LimitsAStepToWhatTheRecentPastAllows)
{
    tFilterBench bench;
    // The threshold grows from 3e-7 to 6e-7 to 1e-6 behind the second to fourth pair.
    EXPECT_EQ(1e-7, bench.filter.filter(1e-7, 0.0));
    EXPECT_EQ(2e-7, bench.filter.filter(2e-7, 1.0));
    EXPECT_EQ(0x1.0c6f7a0b5ed8dp-21, bench.filter.filter(1.2e-6, 1.0)); // 5e-7
    EXPECT_EQ(0x1.27476ca61b882p-20, bench.filter.filter(1.2e-6, 1.0)); // 1.1e-6
    bench.filter.reset();
    EXPECT_EQ(1e-7, bench.filter.filter(1e-7, 0.0));
    EXPECT_EQ(2e-7, bench.filter.filter(2e-7, 1.0));
    EXPECT_EQ(0x1.0c6f7a0b5ed8dp-21, bench.filter.filter(1.2e-6, 1.0))
        << "nothing of the past is left";
    bench.config.setSpikeFilterMaxThreshold(1e-6);
    bench.filter.reset();
    EXPECT_EQ(-2e-6, bench.filter.filter(-1.0, 2.0)) << "a downward spike";
    EXPECT_EQ(-1.0, bench.filter.filter(-1.0, -2.0)) << "time that went backwards passes";
    EXPECT_EQ(-1.0, bench.filter.filter(-1.0, 0.0));
    EXPECT_EQ(-1.0 + 1e-6, bench.filter.filter(1.0, 1.0)) << "and is the new base";
    bench.config.setSpikeFilterMaxThreshold(7.13e-7);
    bench.filter.reset();
    bench.filter.filter(-8.7e-8, 0.0);
    EXPECT_EQ(0x1.10840345b4defp-23, bench.filter.filter(0x1.10840345b4defp-23, 0.3))
        << "at the threshold";
    tFilterBench open;
    open.filter.filter(0.0, 0.0);
    EXPECT_EQ(1.0, open.filter.filter(1.5, 1.0)) << "a first lock";
}

TEST(SpikeFilter, KeepsARunningSumThroughChangesOfItsSize)
{
    tFilterBench bench;
    double returned[60];
    uint32_t state = 12345;
    for (int i = 0; i < 60; ++i) {
        state = (state * 1103515245U + 12345U) & 0x7fffffffU;
        double offset = (static_cast<int>(state % 2001U) - 1000) * 1e-9;
        if (state % 7U == 0) offset *= 40.0;
        if (i == 30) bench.config.setSpikeFilterHistorySize(2);
        if (i == 40) bench.config.setSpikeFilterHistorySize(7);
        returned[i] = bench.filter.filter(offset, i % 3 != 0 ? 0.125 : 1.0);
    }
    // A history summed anew differs in the last bits of each of these.
    EXPECT_EQ(0x1.56bed93e78a81p-17, returned[20]);
    EXPECT_EQ(0x1.c788f3b7a5bd0p-23, returned[31]);
    EXPECT_EQ(0x1.0731d619853cbp-15, returned[39]);
    EXPECT_EQ(-0x1.0c316b392d254p-22, returned[56]);
}

TEST(SpikeFilter, RestsAtItsLimitsAndStandsStillWhileOff)
{
    tFilterBench bench;
    bench.filter.filter(0.0, 0.0);
    for (int i = 0; i < 6; ++i) {
        bench.filter.filter(0.0, 1.0);
    }
    EXPECT_EQ(2.5e-8, bench.filter.filter(2.5e-8, 1.0)) << "a rate exactly at the floor passes";
    bench.config.setSpikeFilterEnabled(false);
    EXPECT_EQ(9.0, bench.filter.filter(9.0, 1.0));
    bench.config.setSpikeFilterEnabled(true);
    EXPECT_EQ(5e-8, bench.filter.filter(9.0, 1.0)) << "against the offset from before";

    bench.config.setSpikeFilterMaxThreshold(1e-9);
    bench.config.setSpikeFilterMinThreshold(0.5); // above the maximum: the maximum is tested first
    bench.filter.filter(5e-8, 1.0);
    const double base = bench.filter.filter(5e-8, 0.0);
    EXPECT_EQ(base + 1e-9, bench.filter.filter(1.0, 1.0));
}

// Takes the exact ratios that a state sends, before they are rounded for a host.
struct tFakeTimekeeper : zvckmDravik::iTimekeeper, zvckmDravik::iServoSMController {
    void stepTime(const tTimeSpan& /*delta*/) override {}
    double getFrequency() override { return current; }
    void setFrequency(double ratio) override { sent = ratio; }
    void setState(zvckmDravik::tServoStateId id) override { state = id; }

    double current = 1.0;
    double sent = 0.0;
    zvckmDravik::tServoStateId state = zvckmDravik::kStateIdle;
};

TEST(ControlLaw, KeepsItsOrderOfOperations)
{
    // Chosen so that other groupings, fused operations and other conversions give other bits.
    tFakeHost host;
    host.maxPpb = INT32_MAX;
    host.minPpb = INT32_MIN;
    zvckmDravik::iServoConfig& config = host.open().config();
    tFakeTimekeeper clock;

    config.setSnapTimeThreshold(10.0);
    config.setPhaseLockGain(1.8);
    config.setPhaseLockCoefficientA(2.663);
    config.setPhaseLockCoefficientB(3.751);
    config.setPhaseLockCoefficientC(-1.66);
    zvckmDravik::tServoStatePhaseLock phaseLock(clock, clock, config);
    phaseLock.adjustTime(tTimeSpan(kSecond), tTimeSpan(kSecond + 504033148U));
    clock.current = 1.0 + 338855945.0 * 1e-9;
    phaseLock.adjustTime(tTimeSpan(2 * kSecond), tTimeSpan(2 * kSecond + 662460827U));
    EXPECT_EQ(0x1.5493d670cc81dp-1, clock.sent);

    config.setFrequencyLockGain(1.0062);
    zvckmDravik::tServoStateFrequencyLock frequencyLock(clock, clock, config);
    clock.current = 1.0 + -7889753.0 * 1e-9;
    frequencyLock.adjustTime(tTimeSpan(kSecond), tTimeSpan(kSecond));
    frequencyLock.adjustTime(tTimeSpan(kSecond + 821448126U), tTimeSpan(kSecond + 830073527U));
    EXPECT_EQ(0x1.f9cc7db9a9a02p-1, clock.sent);
    EXPECT_EQ(zvckmDravik::kStateSnapTime, clock.state);
}

TEST(Timekeeper, SendsWholePartsPerBillionAndExactSteps)
{
    const double half = 1.0 / 1024; // 976562.5 parts per billion, exactly
    tFakeHost host;
    zvckmDravik::iTimekeeper& timekeeper = host.open().timekeeper();
    for (const auto& [ratio, sent] : {std::pair<double, const char*>{1.0, "0"},
                                      {1.0 + 0.7e-9, "1"},
                                      {1.0 + half, "976563"},
                                      {1.0 - half, "-976563"},
                                      {4.0, "2147483647"},
                                      {-4.0, "-2147483648"},
                                      {kInfinity, "2147483647"},
                                      {kNaN, "0"},
                                      {-kInfinity, "-2147483648"},
                                      {1.0 - 110e-9, "-110"},
                                      {0x1.0000000abcc77p+0, "2"}}) {
        timekeeper.setFrequency(ratio);
        EXPECT_EQ(std::string("set ") + sent, host.takeCalls()) << ratio;
    }
    host.offsetPpb = -1051970500;
    EXPECT_EQ(-0x1.a9be09bb6aa60p-5, timekeeper.getFrequency());
    host.takeCalls();
    timekeeper.stepTime(tTimeSpan(5U, -1));
    timekeeper.stepTime(tTimeSpan(INT64_MIN));
    EXPECT_EQ("step -5 step -9223372036854775808", host.takeCalls());
}

// Plays pairs, written as "reference in seconds, how far the clock is ahead in nanoseconds, and the
// calls that the pair must lead to", with " | " in between; "clear" is a clearHistory.
void play(tFakeHost& host, const std::string& script, int32_t code = 0)
{
    std::istringstream steps(script);
    for (std::string step; std::getline(steps >> std::ws, step, '|');) {
        std::istringstream words(step);
        int64_t seconds = 0;
        int64_t aheadNs = 0;
        std::string calls;
        if (step.find("clear") != std::string::npos) {
            host.clearHistory();
        } else {
            ASSERT_TRUE(words >> seconds >> aheadNs) << script;
            std::getline(words >> std::ws, calls);
            const uint64_t reference = static_cast<uint64_t>(seconds) * kSecond;
            host.pair(reference, reference + static_cast<uint64_t>(aheadNs));
        }
        calls.erase(calls.find_last_not_of(' ') + 1);
        EXPECT_EQ(code, host.code()) << step;
        EXPECT_EQ(calls, host.takeCalls()) << step;
    }
}

const std::string kMeasured = "1 0 | 2 0 get set 0 | ";
const std::string kLockIn = kMeasured + "3 0 | ";

TEST(StateMachine, LeadsPairsThroughTheStates)
{
    const struct {
        const char* name;
        std::string script;
        int32_t minPpb = -500000, maxPpb = 500000, offsetPpb = 0;
    } rows[] = {
        {"12 ppm off to locked", "1 1000000 | 2 1012000 get set -12000 | 3 1012000 step -1012000 | "
                                 "4 100 get set -12110 |5 0 get set -12055"},
        {"100010 ppb from ten seconds",
         "0 0 | 10 -1000000 get set 100010 | 11 0 | 12 0 get set 100010"},
        {"identical pairs are no measurement", "1 0 | 1 0 get set 0 | 1 0"},
        {"a clock that stands",
         "1 0 | 2 -1000000000 get set 500000 | 3 0 | 4 0 get set 500000 | 5 0"},
        {"a clock that went backwards", "2 0 | 3 -2000000000 get set -500000 | 3 0"},
        {"both went backwards, a valid rate", "9 0 | 8 0 get set 0 | 7 0 | 6 0 get set 0"},
        {"an offset at the maximum is within",
         "1 0 | 2 0 get set 1953125 | 3 1000000000 step -1000000000", 0, 1953125, 1953125},
        {"an offset at the minimum is within",
         "1 0 | 2 0 get set -1953125 | 3 1000000000 step -1000000000", -1953125, 0, -1953125},
        {"differences across the wrap", "-1 0 | 0 0 get set 0 | 1 -1000000001 step 1000000001"},
        {"timestamps of this century",
         "1700000001 0 | 1700000002 0 get set 0 | 1700000003 0 | 1700000004 100 get set -110"},
        {"a step at the threshold", kMeasured + "3 -1000 step 1000"},
        {"no step below it", kMeasured + "3 -999 | 4 -999 get set 1099"},
        {"a lock holds below the threshold and is lost at it",
         kLockIn + "4 999 get set -1099 | 5 1000 | 6 0 | 7 0 get set -1099"},
        {"a lock is lost behind too", kLockIn + "4 -1000 | 5 0 | 6 0 get set 0"},
        {"a second lock starts without the first one's error",
         kLockIn + "4 500 get set -550 | 5 1000 | 6 0 | 7 0 get set -550 | 8 0 | 9 0 get set -550"},
        {"the law is clamped", kLockIn + "4 900 get set -100 | 5 -900 get set 100", -100, 100},
        {"limits that cross keep it measuring",
         "1 0 | 2 0 get set -7 | 3 0 | 4 -1000000000 get set -7", 7, -7},
        {"clearHistory forgets a first pair", "1 0 | clear | 2 0 | 3 0 get set 0"},
        {"clearHistory leaves snap time",
         kMeasured + "clear | 3 1000000000 | 4 1000000000 get set 0"},
        {"clearHistory leaves phase lock",
         kLockIn + "clear | 4 1000000000 | 5 1000000000 get set 0 | 6 1000000000 step -1000000000"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        tFakeHost host;
        host.minPpb = row.minPpb;
        host.maxPpb = row.maxPpb;
        host.offsetPpb = row.offsetPpb;
        host.initialize();
        host.takeCalls();
        play(host, row.script);
    }
}

TEST(StateMachine, IdleAndWhatIsNoStateLeaveTheClockAlone)
{
    for (const uint32_t id : {0U, 4U}) {
        tFakeHost host;
        host.open().controller().setState(static_cast<zvckmDravik::tServoStateId>(id));
        host.takeCalls();
        play(host, "1 0 | 2 0 | 3 1000000 | clear | 4 0 | 5 0 get set 0");
    }
}

TEST(StateMachine, ThresholdsDifferBetweenSnapTimeAndPhaseLock)
{
    tFakeHost host;
    host.open().config().setSnapTimeThreshold(1.5e-8); // 14 ns when cut, 15 ns as it is
    play(host, kMeasured + "3 14 step -14 | 4 14 get set -15 | 5 15");
}

TEST(StateMachine, NothingIsRolledBackWhenTheClockFails)
{
    const struct {
        const char* name;
        std::string before;
        const char *failing, *failed, *after;
    } rows[] = {
        // The first pair stays, and the next pair measures from it over two seconds.
        {"frequency lock, getFrequency", "1 0", "getFrequency", "2 0 get",
         "3 2000 get set -1000 | 4 1000000 step -1000000"},
        {"frequency lock, setFrequency", "1 0", "setFrequency", "2 0 get set 0",
         "3 2000 get set -1000 | 4 1000000 step -1000000"},
        // The first pair was forgotten before the call.
        {"frequency lock, clamped", "1 0", "setFrequency", "2 -1000000000 get set 500000", "3 0"},
        {"snap time", "1 0 | 2 0 get set 0", "stepTime", "3 1000000 step -1000000",
         "4 2000000 step -2000000 | 5 0 get set 0"},
        // The failed pair's error of 100 ns never becomes the previous error.
        {"phase lock, getFrequency", kLockIn + "4 0 get set 0", "getFrequency", "5 100 get",
         "6 0 get set 0"},
        {"phase lock, setFrequency", kLockIn + "4 0 get set 0", "setFrequency",
         "5 100 get set -110", "6 0 get set 0"}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        tFakeHost host;
        host.initialize();
        host.takeCalls();
        play(host, row.before);
        const int32_t offsetPpb = host.offsetPpb;
        host.failIn(row.failing);
        play(host, row.failed, -77);
        host.inOperation = nullptr;
        host.offsetPpb = offsetPpb; // the clock did not take it
        play(host, row.after);
    }
}

TEST(StateMachine, TheFilterStartsOpenAndIsResetWhenALockEnds)
{
    tFakeHost host;
    zvckmDravik::iServoConfig& config = host.open().config();
    config.setSpikeFilterEnabled(true);
    config.setSpikeFilterMaxThreshold(1e-7);
    // Open up to 1.0 at first, not to the maximum; then limited to 100 ns in a second.
    play(host, kLockIn + "4 0 get set 0 | 5 900 get set -990 | 6 900 get set -1485 |"
                         "7 0 get set -1870 | 8 0 get set -2200 | 9 1000");
    host.offsetPpb = 0;
    // A first pair passes whole, the next ones by the configured maximum.
    play(host, "10 0 | 11 0 get set 0 | 12 0 | 13 900 get set -990 | 14 888 get set -1472 |"
               "15 0 get set -1921");
}

TEST(StateMachine, AnExhaustedAllocatorLeavesAPairHalfTaken)
{
    tFakeHost host;
    host.open().config().setSpikeFilterEnabled(true);
    play(host, kLockIn + "4 0 get set 0");
    {
        const allocator::tFailNth failing(1); // the first entry of the history
        host.status.reset();
        zvckmservo_adjustTime(&host.table, 5 * kSecond, 5 * kSecond + 100, &host.status.record);
        EXPECT_TRUE(failing.fired());
    }
    EXPECT_EQ(-52000, host.code());
    EXPECT_EQ("", host.takeCalls());
    // The filter's last offset is the failed pair's 100 ns, the law's previous error is still 0:
    // a rate of 100 ns/s and nothing else limits the pair behind the next, to 200 + 3 * 100.
    play(host, "6 200 get set -220 | 7 900 get set -660");
}

TEST(StateMachine, ASetterTouchesItsOwnParameterOnly)
{
    tFakeHost host;
    tOpenServo& servo = host.open();
    servo.config().setSpikeFilterEnabled(true);
    for (const char* const step : {"1 0", "2 0 get set 0", "3 0", "4 100 get set -110",
                                   "5 200 get set -275", "6 900 get set -715"}) {
        servo.writeServoConfigJson(servo.readServoConfigJson()); // each to what it is
        play(host, step);
    }
}

TEST(StateMachine, OneLockCoversAPairAndEveryOtherCall)
{
    tFakeHost host;
    tOpenServo& servo = host.open();
    const std::function<void()> others[] = {
        [&] { servo.config().getPhaseLockGain(); },
        [&] { servo.config().setPhaseLockGain(0.55); },
        [&] { servo.controller().setState(zvckmDravik::kStatePhaseLock); },
        [&] { servo.writeServoConfigJson("{}"); },
        [&] { servo.readServoConfigJson(); },
        [&] { servo.readConfigFile("/none"); },
        [&] { servo.applyMetaData("{}"); }};
    for (const std::function<void()>& other : others) {
        host.takeCalls();
        play(host, "clear | 1 0"); // the states involved take no lock themselves
        std::atomic<bool> through{false};
        std::thread thread;
        host.inOperation = [&](const std::string& operation, zverr_Status*) {
            if (operation != "setFrequency") {
                thread = std::thread([&] {
                    other();
                    through = true;
                });
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
            EXPECT_FALSE(through) << operation; // the pair's second operation included
        };
        host.pair(2 * kSecond, 2 * kSecond);
        thread.join();
        through = false;
        uint64_t time = 0;
        zvckmservo_getTime(&host.table, &time, &host.status.record);
        thread.join();
    }
}

TEST(StateMachine, AHostMayCallBackAndThePairGoesOnWhereItWas)
{
    tFakeHost host;
    host.initialize();
    host.takeCalls();
    host.inOperation = [&host](const std::string& operation, zverr_Status*) {
        zverr_Status inner{0, 0, foreignReallocJson, nullptr};
        if (operation == "getFrequency") zvckmservo_clearHistory(&host.table, &inner);
        EXPECT_EQ(0, inner.code);
    };
    play(host, kLockIn + "4 100 get set -110 | 5 0");
}

TEST(StateMachine, AHostMayCallBackFromEveryOperation)
{
    using tCall = void (*)(zvckmservo_HostTable*, zverr_Status*);
    const tCall calls[] = {
        [](auto* h, auto* s) { zvckmservo_clearHistory(h, s); },
        [](auto* h, auto* s) { zvckmservo_adjustTime(h, 9 * kSecond, 9 * kSecond, s); },
        [](auto* h, auto* s) { zvckmservo_adjustTime(h, 9 * kSecond, 12 * kSecond, s); },
        [](auto* h, auto* s) {
            const char* const fewer = R"({"spikeFilterHistorySize":2,"spikeFilterEnabled":1})";
            zvckmservo_writeServoConfigJson(h, fewer, s);
        },
        [](auto* h, auto* s) {
            char buffer[512];
            zvckmservo_readServoConfigJson(h, buffer, sizeof buffer, s);
        },
        [](auto* h, auto* s) { zvckmservo_applyMetaData(h, "{}", s); },
        [](auto* h, auto* s) {
            uint64_t time = 0;
            zvckmservo_getTime(h, &time, s);
        }};
    for (const std::string operation : {"getTime", "stepTime", "getFrequency", "setFrequency"}) {
        for (const tCall call : calls) {
            tFakeHost host;
            host.open().config().setSpikeFilterEnabled(true);
            bool inside = false;
            int times = 0;
            host.inOperation = [&](const std::string& present, zverr_Status*) {
                if (inside || present != operation) return;
                inside = true;
                ++times;
                tHostStatus inner;
                call(&host.table, &inner.record);
                EXPECT_EQ(0, inner.code());
                inside = false;
            };
            uint64_t time = 0;
            for (uint64_t seconds = 1; seconds < 20; ++seconds) {
                const uint64_t aheadNs = seconds == 3 ? 5000 : seconds % 7 * 100;
                host.pair(seconds * kSecond, seconds * kSecond + aheadNs);
                EXPECT_EQ(0, host.code());
                zvckmservo_getTime(&host.table, &time, &host.status.record);
            }
            EXPECT_GT(times, 0) << operation;
            host.inOperation = nullptr;
            host.clearHistory();
            host.takeCalls();
            host.offsetPpb = 0;
            play(host, kLockIn);
        }
    }
}

TEST(PhaseLock, ALockedPairAllocatesNothingOnceTheHistoryIsFull)
{
    for (const uint32_t historySize : {5U, 100U}) {
        tFakeHost host;
        zvckmDravik::iServoConfig& config = host.open().config();
        config.setSpikeFilterEnabled(true);
        config.setSpikeFilterHistorySize(historySize);
        play(host, kLockIn);
        host.table.getFrequency = [](int32_t* offsetPpb, zverr_Status*) { *offsetPpb = 0; };
        host.table.setFrequency = [](int32_t, zverr_Status*) {};
        uint64_t seconds = 4;
        for (; seconds < 4 + 2 * historySize; ++seconds) {
            host.pair(seconds * kSecond, seconds * kSecond + seconds % 7);
        }
        const long before = allocator::allocations();
        for (const uint64_t end = seconds + 1000; seconds < end; ++seconds) {
            host.pair(seconds * kSecond, seconds * kSecond + seconds % 7);
        }
        EXPECT_EQ(before, allocator::allocations());
    }
}

} // namespace
