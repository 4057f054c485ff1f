// The servo core: time spans, the spike filter, the states, and the servo on a scripted clock.

#include "dravik/tServoStateFrequencyLock.h"
#include "dravik/tServoStatePhaseLock.h"
#include "support/allocator.h"
#include "support/tFakeHost.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>

namespace {

using zvckmDravik::tTimeSpan;

constexpr uint64_t kSecond = 1000000000U;
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

using tCalls = std::vector<std::string>;

TEST(TimeSpan, FromAndToSeconds)
{
    struct Row {
        double seconds;
        uint64_t magnitude;
        int32_t sign;
    };
    const Row rows[] = {
        {0.5, 500000000, 1},
        {-1.5, 1500000000, -1},
        {1e-6, 1000, 1},
        {1.5e-8, 14, 1},
        {-0.0, 0, 1},
        {kNaN, 0, -1},
        {1.9999999999, 1999999999, 1},
        {10.0, 10 * kSecond, 1},
        {kInfinity, 4294967295U * kSecond + 4294967295U, 1}, // both conversions saturate
    };
    for (const Row& row : rows) {
        const tTimeSpan span(row.seconds);
        EXPECT_EQ(row.magnitude, span.getMagnitude()) << row.seconds;
        EXPECT_EQ(row.sign, span.getSign()) << row.seconds;
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
    struct Row {
        tTimeSpan a, b;
        int64_t difference;
        bool greater, greaterOrEqual;
    };
    const uint64_t big = uint64_t{1} << 63;
    const Row rows[] = {
        {tTimeSpan(uint64_t{5}), tTimeSpan(uint64_t{7}), -2, false, false},
        {tTimeSpan(uint64_t{7}), tTimeSpan(uint64_t{7}), 0, false, true},
        {tTimeSpan(3U, -1), tTimeSpan(5U, -1), 2, true, true},
        {tTimeSpan(5U, -1), tTimeSpan(3U, -1), -2, false, false},
        {tTimeSpan(uint64_t{1}), tTimeSpan(9U, -1), 10, true, true},
        {tTimeSpan(9U, -1), tTimeSpan(uint64_t{1}), -10, false, false},
        {tTimeSpan(uint64_t{0}), tTimeSpan(0U, -1), 0, true, true},
        {tTimeSpan(0U, -1), tTimeSpan(uint64_t{0}), 0, false, false},
        {tTimeSpan(big + 3), tTimeSpan(big - 4), 7, true, true},
        {tTimeSpan(uint64_t{2}), tTimeSpan(UINT64_MAX), 3, false, false},
        {tTimeSpan(big), tTimeSpan(uint64_t{0}), INT64_MIN, true, true},
    };
    for (const Row& row : rows) {
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
    bench.config.setSpikeFilterMaxThreshold(1e-6);
    bench.filter.reset();
    EXPECT_EQ(-2e-6, bench.filter.filter(-1.0, 2.0)) << "a downward spike";
    EXPECT_EQ(-1.0, bench.filter.filter(-1.0, -2.0)) << "time that went backwards passes";
    EXPECT_EQ(-1.0, bench.filter.filter(-1.0, 0.0));
    EXPECT_EQ(-1.0 + 1e-6, bench.filter.filter(1.0, 1.0)) << "and is the new base";
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

    bench.config.setSpikeFilterMinThreshold(0.5); // above the maximum: the maximum is tested first
    bench.config.setSpikeFilterMaxThreshold(1e-9);
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
    config.setPhaseLockGain(2.633);
    config.setPhaseLockCoefficientA(-1.708);
    config.setPhaseLockCoefficientB(-4.249);
    config.setPhaseLockCoefficientC(-1.221);
    zvckmDravik::tServoStatePhaseLock phaseLock(clock, clock, config);
    phaseLock.adjustTime(tTimeSpan(kSecond), tTimeSpan(kSecond + 481697671U));
    clock.current = 1.0 + -499706259.0 * 1e-9;
    phaseLock.adjustTime(tTimeSpan(2 * kSecond), tTimeSpan(2 * kSecond + 931510365U));
    EXPECT_EQ(0x1.a417d56e48dbep-2, clock.sent);

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
    struct Row {
        double ratio;
        const char* sent;
    };
    const double half = 1.0 / 1024; // 976562.5 parts per billion, exactly
    const Row rows[] = {
        {1.0, "0"},          {1.0 + half, "976563"},      {1.0 - half, "-976563"},
        {4.0, "2147483647"}, {-4.0, "-2147483648"},       {kInfinity, "2147483647"},
        {kNaN, "0"},         {-kInfinity, "-2147483648"}, {1.0 - 110e-9, "-110"},
    };
    tFakeHost host;
    zvckmDravik::iTimekeeper& timekeeper = host.open().timekeeper();
    for (const Row& row : rows) {
        timekeeper.setFrequency(row.ratio);
        EXPECT_EQ(tCalls{std::string("setFrequency ") + row.sent}, host.takeCalls()) << row.ratio;
    }
    host.offsetPpb = -1000;
    EXPECT_EQ(1.0 + -1000.0 * 1e-9, timekeeper.getFrequency());
    host.takeCalls();
    timekeeper.stepTime(tTimeSpan(5U, -1));
    timekeeper.stepTime(tTimeSpan(INT64_MIN));
    EXPECT_EQ((tCalls{"stepTime -5", "stepTime -9223372036854775808"}), host.takeCalls());
}

// A pair as reference and clock in nanoseconds, and the calls that it must lead to.
struct tStep {
    uint64_t reference, clock;
    tCalls calls;
};

struct tScenario {
    const char* name;
    std::function<void(tFakeHost&)> prepare;
    std::vector<tStep> steps;
};

TEST(StateMachine, LeadsPairsThroughTheStates)
{
    const auto nothing = [](tFakeHost&) {};
    const auto locked = [](tFakeHost& host) { host.lock(); };
    const uint64_t s = kSecond;
    const tCalls none;
    const tCalls keep{"getFrequency", "setFrequency 0"};
    const tScenario scenarios[] = {
        {"12 ppm off to locked",
         nothing,
         {{1 * s, 1 * s + 1000000, none},
          {2 * s, 2 * s + 1012000, {"getFrequency", "setFrequency -12000"}},
          {3 * s, 3 * s + 1012000, {"stepTime -1012000"}},
          {4 * s, 4 * s + 100, {"getFrequency", "setFrequency -12110"}},
          {5 * s, 5 * s, {"getFrequency", "setFrequency -12055"}}}},
        {"100010 ppb from ten seconds",
         nothing,
         {{0, 0, none},
          {10 * s, 9999000000, {"getFrequency", "setFrequency 100010"}},
          {11 * s, 11 * s, none},
          {12 * s, 12 * s, {"getFrequency", "setFrequency 100010"}}}},
        {"identical pairs are no measurement",
         nothing,
         {{s, s, none}, {s, s, {"getFrequency", "setFrequency 0"}}, {s, s, none}}},
        {"a clock that stands",
         nothing,
         {{s, s, none},
          {2 * s, s, {"getFrequency", "setFrequency 500000"}},
          {3 * s, 3 * s, none},
          {4 * s, 4 * s, {"getFrequency", "setFrequency 500000"}},
          {5 * s, 5 * s, none}}},
        {"a clock that went backwards",
         nothing,
         {{2 * s, 2 * s, none},
          {3 * s, 1 * s, {"getFrequency", "setFrequency -500000"}},
          {3 * s, 3 * s, none}}},
        {"both went backwards: a valid rate",
         nothing,
         {{9 * s, 9 * s, none}, {8 * s, 8 * s, keep}, {7 * s, 7 * s, none}, {6 * s, 6 * s, keep}}},
        {"an offset at the limit is within",
         [](tFakeHost& host) { host.offsetPpb = 500000; },
         {{s, s, none},
          {2 * s, 2 * s, {"getFrequency", "setFrequency 500000"}},
          {3 * s, 4 * s, {"stepTime -1000000000"}}}},
        {"differences across the wrap",
         nothing,
         {{UINT64_MAX - s + 1, UINT64_MAX - s + 1, none},
          {0, 0, keep},
          {s, UINT64_MAX, {"stepTime 1000000001"}}}},
        {"a step at the threshold",
         nothing,
         {{s, s, none}, {2 * s, 2 * s, keep}, {3 * s, 3 * s - 1000, {"stepTime 1000"}}}},
        {"no step below it",
         nothing,
         {{s, s, none},
          {2 * s, 2 * s, keep},
          {3 * s, 3 * s - 999, none},
          {4 * s, 4 * s - 999, {"getFrequency", "setFrequency 1099"}}}},
        {"a lock is lost at the threshold, held below",
         locked,
         {{4 * s, 4 * s + 999, {"getFrequency", "setFrequency -1099"}},
          {5 * s, 5 * s + 1000, none},
          {6 * s, 6 * s, none},
          {7 * s, 7 * s, {"getFrequency", "setFrequency -1099"}}}},
        {"the second lock starts without the first one's error",
         locked,
         {{4 * s, 4 * s + 500, {"getFrequency", "setFrequency -550"}},
          {5 * s, 5 * s + 1000, none},
          {6 * s, 6 * s, none},
          {7 * s, 7 * s, {"getFrequency", "setFrequency -550"}},
          {8 * s, 8 * s, none},
          {9 * s, 9 * s, {"getFrequency", "setFrequency -550"}}}},
        {"the law is clamped",
         [](tFakeHost& host) {
             host.maxPpb = 100;
             host.minPpb = -100;
             zvckmservo_finalize(&host.table);
             host.initialize();
             host.lock();
         },
         {{4 * s, 4 * s + 900, {"getFrequency", "setFrequency -100"}},
          {5 * s, 5 * s - 900, {"getFrequency", "setFrequency 100"}}}},
        {"limits that cross keep it measuring",
         [](tFakeHost& host) {
             host.maxPpb = -7;
             host.minPpb = 7;
             zvckmservo_finalize(&host.table);
             host.initialize();
             host.takeCalls();
         },
         {{s, s, none},
          {2 * s, 2 * s, {"getFrequency", "setFrequency -7"}},
          {3 * s, 3 * s, none},
          {4 * s, 3 * s, {"getFrequency", "setFrequency -7"}}}},
        {"clearHistory forgets a first pair",
         [](tFakeHost& host) {
             host.pair(kSecond, kSecond);
             host.clearHistory();
         },
         {{2 * s, 2 * s, none}, {3 * s, 3 * s, keep}}},
        {"clearHistory leaves snap time",
         [](tFakeHost& host) {
             host.pair(kSecond, kSecond);
             host.pair(2 * kSecond, 2 * kSecond);
             host.takeCalls();
             host.clearHistory();
         },
         {{3 * s, 4 * s, none}, {4 * s, 5 * s, keep}}},
        {"clearHistory leaves phase lock",
         [](tFakeHost& host) {
             host.lock();
             host.clearHistory();
         },
         {{4 * s, 5 * s, none}, {5 * s, 6 * s, keep}, {6 * s, 7 * s, {"stepTime -1000000000"}}}},
    };
    for (const tScenario& scenario : scenarios) {
        SCOPED_TRACE(scenario.name);
        tFakeHost host;
        host.initialize();
        host.takeCalls();
        scenario.prepare(host);
        for (const tStep& step : scenario.steps) {
            host.pair(step.reference, step.clock);
            EXPECT_EQ(0, host.code());
            EXPECT_EQ(step.calls, host.takeCalls()) << "pair at " << step.reference;
        }
    }
}

TEST(StateMachine, ThresholdsDifferBetweenSnapTimeAndPhaseLock)
{
    tFakeHost host;
    host.open().config().setSnapTimeThreshold(1.5e-8);
    host.pair(1 * kSecond, 1 * kSecond);
    host.pair(2 * kSecond, 2 * kSecond);
    host.takeCalls();
    host.pair(3 * kSecond, 3 * kSecond + 14);
    EXPECT_EQ(tCalls{"stepTime -14"}, host.takeCalls()) << "cut to 14 ns";
    host.pair(4 * kSecond, 4 * kSecond + 14);
    EXPECT_EQ((tCalls{"getFrequency", "setFrequency -15"}), host.takeCalls()) << "15 ns";
    host.pair(5 * kSecond, 5 * kSecond + 15);
    EXPECT_EQ(tCalls{}, host.takeCalls());
}

TEST(StateMachine, NothingIsRolledBackWhenTheClockFails)
{
    const uint64_t s = kSecond;
    struct Row {
        const char* name;
        std::vector<tStep> before;
        const char* failing;
        tStep failed;
        std::vector<tStep> after;
    };
    const tCalls none;
    const tCalls keep{"getFrequency", "setFrequency 0"};
    const Row rows[] = {
        // The first pair stays, and the next pair measures from it over two seconds.
        {"frequency lock, getFrequency",
         {{s, s, none}},
         "getFrequency",
         {2 * s, 2 * s, {"getFrequency"}},
         {{3 * s, 3 * s + 2000, {"getFrequency", "setFrequency -1000"}},
          {4 * s, 5 * s, {"stepTime -1000000000"}}}},
        {"frequency lock, setFrequency",
         {{s, s, none}},
         "setFrequency",
         {2 * s, 2 * s, keep},
         {{3 * s, 3 * s + 2000, {"getFrequency", "setFrequency -1000"}},
          {4 * s, 5 * s, {"stepTime -1000000000"}}}},
        // The first pair was forgotten before the call.
        {"frequency lock, clamped",
         {{s, s, none}},
         "setFrequency",
         {2 * s, s, {"getFrequency", "setFrequency 500000"}},
         {{3 * s, 3 * s, none}}},
        {"snap time",
         {{s, s, none}, {2 * s, 2 * s, keep}},
         "stepTime",
         {3 * s, 4 * s, {"stepTime -1000000000"}},
         {{4 * s, 6 * s, {"stepTime -2000000000"}}, {5 * s, 5 * s, keep}}},
        // The failed pair's error of 100 ns never becomes the previous error.
        {"phase lock, getFrequency",
         {{s, s, none}, {2 * s, 2 * s, keep}, {3 * s, 3 * s, none}},
         "getFrequency",
         {4 * s, 4 * s + 100, {"getFrequency"}},
         {{5 * s, 5 * s, keep}}},
        {"phase lock, setFrequency",
         {{s, s, none}, {2 * s, 2 * s, keep}, {3 * s, 3 * s, none}},
         "setFrequency",
         {4 * s, 4 * s + 100, {"getFrequency", "setFrequency -110"}},
         {{5 * s, 5 * s, keep}}},
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        tFakeHost host;
        host.initialize();
        host.takeCalls();
        const auto play = [&host](const tStep& step, int32_t code) {
            host.pair(step.reference, step.clock);
            EXPECT_EQ(code, host.code());
            EXPECT_EQ(step.calls, host.takeCalls()) << "pair at " << step.reference;
        };
        for (const tStep& step : row.before) {
            play(step, 0);
        }
        const int32_t offsetPpb = host.offsetPpb;
        host.failIn(row.failing);
        play(row.failed, -77);
        host.inOperation = nullptr;
        host.offsetPpb = offsetPpb; // the clock did not take it
        for (const tStep& step : row.after) {
            play(step, 0);
        }
    }
}

TEST(StateMachine, TheFilterStartsOpenAndIsResetWhenALockEnds)
{
    tFakeHost host;
    zvckmDravik::iServoConfig& config = host.open().config();
    config.setSpikeFilterEnabled(true);
    config.setSpikeFilterMaxThreshold(1e-7);
    host.lock();
    const auto expectPair = [&host](uint64_t seconds, uint64_t error, const tCalls& calls) {
        host.pair(seconds * kSecond, seconds * kSecond + error);
        EXPECT_EQ(calls, host.takeCalls()) << seconds << " s";
    };
    expectPair(4, 0, {"getFrequency", "setFrequency 0"});
    expectPair(5, 900, {"getFrequency", "setFrequency -990"}); // open: 1.0, not the maximum
    expectPair(6, 900, {"getFrequency", "setFrequency -1485"});
    expectPair(7, 0, {"getFrequency", "setFrequency -1870"}); // now limited to 100 ns in a second
    host.clearHistory();
    host.offsetPpb = 0;
    for (const uint64_t seconds : {8U, 9U, 10U}) {
        host.pair(seconds * kSecond, seconds * kSecond);
    }
    host.takeCalls();
    expectPair(11, 0, {"getFrequency", "setFrequency 0"});
    expectPair(12, 900, {"getFrequency", "setFrequency -110"}); // reset: the configured maximum
}

TEST(StateMachine, AnExhaustedAllocatorLeavesAPairHalfTaken)
{
    tFakeHost host;
    host.open().config().setSpikeFilterEnabled(true);
    host.lock();
    host.pair(4 * kSecond, 4 * kSecond);
    host.takeCalls();
    {
        const allocator::tFailNth failing(1); // the first entry of the history
        host.status.reset();
        zvckmservo_adjustTime(&host.table, 5 * kSecond, 5 * kSecond + 100, &host.status.record);
        EXPECT_TRUE(failing.fired());
    }
    EXPECT_EQ(-52000, host.code());
    EXPECT_EQ(tCalls{}, host.takeCalls());
    // The filter's last offset is the failed pair's 100 ns, the law's previous error is still 0:
    // a rate of 100 ns/s and nothing else makes the mean that limits the pair behind the next.
    host.pair(6 * kSecond, 6 * kSecond + 200);
    EXPECT_EQ((tCalls{"getFrequency", "setFrequency -220"}), host.takeCalls());
    host.pair(7 * kSecond, 7 * kSecond + 900); // limited to 200 + 3 * 100
    EXPECT_EQ((tCalls{"getFrequency", "setFrequency -660"}), host.takeCalls());
}

TEST(StateMachine, AHostMayCallBackFromItsOwnOperation)
{
    tFakeHost host;
    host.initialize();
    host.lock();
    host.inOperation = [&host](const std::string& operation, zverr_Status*) {
        if (operation != "setFrequency") return;
        zverr_Status inner{0, 0, foreignReallocJson, nullptr};
        zvckmservo_clearHistory(&host.table, &inner);
        EXPECT_EQ(0, inner.code);
    };
    host.pair(4 * kSecond, 4 * kSecond + 100);
    EXPECT_EQ(0, host.code());
    host.inOperation = nullptr;
    host.takeCalls();
    host.pair(5 * kSecond, 5 * kSecond);
    EXPECT_EQ(tCalls{}, host.takeCalls()) << "a first pair";
}

TEST(PhaseLock, ALockedPairAllocatesNothingOnceTheHistoryIsFull)
{
    for (const uint32_t historySize : {5U, 100U}) {
        tFakeHost host;
        zvckmDravik::iServoConfig& config = host.open().config();
        config.setSpikeFilterEnabled(true);
        config.setSpikeFilterHistorySize(historySize);
        host.lock();
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
