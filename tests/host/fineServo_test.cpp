#include "clocks/tSteeredClock.h"
#include "host/stepFixture.h"
#include "servo/tFineServo.h"

using namespace dravikHost;

namespace {

constexpr int64_t kIntervalNs = 100'000'000'000; // over which 1 ns is 0.01 ppb

TEST(FineServo, isAsFineAsLimitsAndThresholdAllow)
{
    const struct {
        int atMost;
        double limitPpb, threshold;
        int factor;
    } kRows[] = {{64, 500'000, 1e-6, 64}, {16, 500'000, 1e-6, 16}, {1, 0, 0, 1},
                 {64, 14e6, 0.15625, 64}, {64, 14.1e6, 1e-6, 32},  {64, 1, 0.157, 32},
                 {64, 1e9, 1e-6, 1},      {64, 2e9, 10, 1},        {64, 4e8, 5, 2}};
    for (const auto& row : kRows) {
        EXPECT_EQ(row.factor, tFineServo::factorFor(row.atMost, row.limitPpb, row.threshold))
            << row.limitPpb << " " << row.threshold;
    }
}

// A clock beside a perfect reference.
struct tBeside {
    tBeside(int factor, uint64_t startNs, double frequencyPpb, int32_t limitPpb = 500'000,
            const tServoParameters& parameters = {})
        : clock(startNs, frequencyPpb, limitPpb), servo(library(), clock, factor, parameters)
    {}

    tLockEvent next()
    {
        referenceNs += kIntervalNs;
        clock.pass(kIntervalNs);
        return servo.adjustTime(referenceNs, clock.timeNs());
    }
    double ordered() const
    {
        const tHostCall* const call = findCall(servo.calls(), kSetFrequency);
        return call != nullptr ? call->ppb : std::nan("");
    }

    uint64_t referenceNs = kStartNs;
    tSteeredClock clock;
    tFineServo servo;
};

TEST(FineServo, measuresAndStepsAsExactlyAsTheServoItself)
{
    for (const uint64_t startNs : {uint64_t{0}, kStartNs, 2 * kStartNs, ~uint64_t{0} - kStartNs}) {
        for (const double offPpb : {0.0, 499'000.123, -499'700.9, 77.7}) {
            for (const int factor : {1, 2, 64}) {
                tBeside beside(factor, startNs, offPpb);
                beside.clock.setOffsetPpb(300); // left by somebody else
                EXPECT_EQ(kNothingNew, beside.next());
                EXPECT_EQ(kFrequencyMeasured, beside.next());
                const double wantedPpb = (1 / (1 + offPpb * 1e-9) - 1) * 1e9;
                EXPECT_NEAR(wantedPpb, beside.ordered(), 0.02 + 0.5 / factor) << offPpb;
                EXPECT_EQ(0, std::remainder(beside.ordered() * factor, 1));
                const auto errorNs =
                    static_cast<int64_t>(beside.clock.timeNs() - beside.referenceNs);
                const tLockEvent event = beside.next();
                EXPECT_EQ(std::llabs(errorNs) >= 1000 ? kStepped : kNotStepped, event);
                if (event == kStepped) {
                    EXPECT_EQ(beside.referenceNs, beside.clock.timeNs());
                    const int64_t steppedNs = findCall(beside.servo.calls(), kStepTime)->ns;
                    EXPECT_NEAR(0, steppedNs + errorNs, 100);
                }
                EXPECT_EQ(kLockGained, beside.next());
            }
        }
    }
}

// Errors of 100 ns in turn, by the built-in law, which begins from what was ordered.
TEST(FineServo, ordersFractions)
{
    tBeside beside(64, kStartNs, 0);
    for (int i = 0; i < 3; ++i)
        beside.next();
    double lawPpb = 0;
    double before = 0;
    for (const int64_t errorNs : {100, -37, 41, 999, -3}) {
        beside.referenceNs += kIntervalNs;
        const uint64_t clockNs = beside.referenceNs + static_cast<uint64_t>(errorNs);
        beside.servo.adjustTime(beside.referenceNs, clockNs);
        const auto error = static_cast<double>(-errorNs);
        lawPpb = std::round(64 * (lawPpb + 0.55 * (2 * error - before))) / 64;
        before = error;
        EXPECT_EQ(lawPpb, beside.ordered()) << errorNs;
        EXPECT_EQ(2U, beside.servo.calls().size()); // and what it asked before
        EXPECT_EQ(lawPpb, beside.clock.offsetPpb());
    }
    EXPECT_EQ(kLockLost, beside.servo.adjustTime(beside.referenceNs, beside.referenceNs - 1000));
}

// A law that forgets its last order, so only its own rounding sets one resolution apart from
// another.
TEST(FineServo, filtersSpikesAsTheServoItself)
{
    tServoParameters parameters;
    parameters.phaseLockCoefficientC = 0;
    parameters.spikeFilterEnabled = 1;
    parameters.spikeFilterMinThreshold = 1e-9; // 100 ns from pair to pair
    parameters.spikeFilterMaxThreshold = 3e-9;
    tBeside coarse(1, kStartNs, 0, 500'000, parameters);
    tBeside fine(64, kStartNs, 0, 500'000, parameters);
    const auto ordered = [](tBeside& beside, int64_t errorNs) {
        beside.referenceNs += kIntervalNs;
        beside.servo.adjustTime(beside.referenceNs,
                                beside.referenceNs + static_cast<uint64_t>(errorNs));
        return beside.ordered();
    };
    for (tBeside* const each : {&coarse, &fine}) {
        for (int i = 0; i < 3; ++i)
            each->next();
    }
    for (const int64_t errorNs : {20, 41, 900, 30, -700, 40, 950, -30, -990})
        EXPECT_NEAR(ordered(coarse, errorNs), ordered(fine, errorNs), 0.52) << errorNs;
}

TEST(FineServo, knowsItsLimits)
{
    for (const auto& [offPpb, event, orderedPpb] :
         {std::tuple<double, tLockEvent, double>{-90, kFrequencyMeasured, 90},
          {-100, kFrequencyMeasured, 100 - 1.0 / 64},
          {-102, kFrequencyAtLimit, 100},
          {5e6, kFrequencyAtLimit, -100}}) {
        tBeside beside(64, kStartNs, offPpb, 100);
        for (int i = 0; i < 3; ++i) { // over and over
            beside.servo.clearHistory();
            beside.clock.setOffsetPpb(0);
            EXPECT_EQ(kNothingNew, beside.next());
            EXPECT_EQ(event, beside.next()) << offPpb;
            EXPECT_EQ(orderedPpb, beside.ordered());
        }
    }
    tServoParameters parameters;
    parameters.frequencyLockGain = 1.00001; // weighs the whole rate
    tBeside weighed(64, kStartNs, 0, 500'000, parameters);
    weighed.next();
    weighed.next();
    EXPECT_EQ(10'000, weighed.ordered());
}

// Of a clock that does not move nothing is measured, and the servo goes on.
TEST(FineServo, outlivesClocksThatStandStill)
{
    tBeside beside(64, kStartNs, 0, 100);
    beside.servo.adjustTime(5, 7);
    EXPECT_EQ(kFrequencyAtLimit, beside.servo.adjustTime(5, 7));
    EXPECT_EQ(0, beside.ordered());
    beside.servo.adjustTime(5, 7);
    EXPECT_EQ(kFrequencyAtLimit, beside.servo.adjustTime(6, 7));
    EXPECT_EQ(100, beside.ordered());
    beside.servo.adjustTime(5, 7);
    EXPECT_EQ(kFrequencyAtLimit, beside.servo.adjustTime(4, 7));
    EXPECT_EQ(-100, beside.ordered());
    beside.next();
    EXPECT_EQ(kFrequencyMeasured, beside.next());
}

TEST(FineServo, keepsThresholdsWithinTheirBounds)
{
    tServoParameters parameters;
    parameters.spikeFilterMaxThreshold = 10;
    parameters.spikeFilterMinThreshold = 10;
    tBeside beside(64, kStartNs, 0, 100, parameters);
    parameters.snapTimeThreshold = 0.16;
    EXPECT_EQ("a snapTimeThreshold of 0.16 s does not go with the resolution of 0.015625 ppb that "
              "this run has; at most 0.15625 s does",
              failureOf([&] { beside.servo.writeParameters(parameters); }));
}

} // namespace
