#include "clocks/tSteeredClock.h"
#include "host/scene.h"
#include "loop/tDiscipline.h"
#include "loop/tHoldoverEstimate.h"
#include "loop/tMeanOrders.h"
#include "loop/tSanityCheck.h"
#include "loop/tSimulatedChain.h"
#include "maths/chainGains.h"
#include "text/quantity.h"

#include <cmath>
#include <sstream>
#include <stdexcept>

using namespace dravikHost;

namespace {

// Errors of 30 and -30 ns, frequencies of 4 and -4 ppb in turn, unless told otherwise.
void lockFor(int pairs, tHoldoverEstimate& estimate, double deviationPpb = 4)
{
    for (int i = 0; i < pairs; ++i) {
        const int sign = i % 2 == 0 ? 1 : -1;
        estimate.add(stepAt(i, int64_t{30} * sign, true, 5000 + deviationPpb * sign));
    }
}

TEST(HoldoverEstimate, growsWithTimeAndForgetsALostLock)
{
    tHoldoverEstimate estimate;
    lockFor(7, estimate);
    EXPECT_FALSE(estimate.errorNs(0));
    lockFor(1, estimate, -4);
    EXPECT_DOUBLE_EQ(30, estimate.errorNs(0).value_or(-1));
    EXPECT_DOUBLE_EQ(50, estimate.errorNs(nsOfSeconds(10)).value_or(-1)); // 30 ns and 10 s * 4 ppb
    EXPECT_NEAR(400, estimate.errorNs(nsOfSeconds(100)).value_or(-1), 2);
    lockFor(56, estimate);
    lockFor(63, estimate, 100); // not a full window yet: the one before counts
    EXPECT_DOUBLE_EQ(50, estimate.errorNs(nsOfSeconds(10)).value_or(-1));
    lockFor(1, estimate, 100);
    EXPECT_NEAR(1000, estimate.errorNs(nsOfSeconds(10)).value_or(-1), 5);
    estimate.add(stepAt(200, 5000, false, 5000));
    EXPECT_FALSE(estimate.errorNs(0));
    lockFor(7, estimate);
    EXPECT_FALSE(estimate.errorNs(0));
}

// A pair a second later each time, and a limit of 10 %: leaps of 101 ms are let pass, 1 ms of them
// as noise.
TEST(SanityCheck, findsLeapsButNotRatesAndOwnSteps)
{
    const struct {
        int64_t referenceNs, clockNs; // by which they leap
        int64_t steppedNs;            // by the servo
        const char* wrong;
    } kRows[] = {
        {900'000, -900'000, 0, ""}, // noise
        {101'000'000, -101'000'000, 0, ""},
        {101'100'000, 0, 0, "the reference leapt by +101.1 ms"},
        {-5'000'000'000, 0, 0, "the reference leapt by -5 s"},
        {0, 2'000'000'000, 0, "the clock leapt by +2 s"},
        {0, -101'100'000, 0, "the clock leapt by -101.1 ms"},
        {0, -3'000'000'000, -3'000'000'000, ""},
        {0, 3'000'000'000, 3'000'000'000, ""},
        {0, 0, 3'000'000'000, "the clock leapt by -3 s"}, // ordered, but not made
    };
    tSanityCheck sanity(0.1e9);
    tPair pair = pairAt(0, 777);
    EXPECT_EQ("", sanity.look(pair, 0));
    int64_t steppedNs = 0;
    for (const auto& row : kRows) {
        pair.elapsedNs += kSecondNs;
        pair.referenceNs += static_cast<uint64_t>(kSecondNs + row.referenceNs);
        pair.clockNs += static_cast<uint64_t>(kSecondNs + row.clockNs);
        const std::string wrong = sanity.look(pair, steppedNs += row.steppedNs);
        EXPECT_EQ(*row.wrong == '\0' ? "" : row.wrong + std::string(" against CLOCK_MONOTONIC_RAW"),
                  wrong);
    }
}

// A clock that counts its orders, and fails at one of them; the first is 1.
struct tStepRow {
    char what;
    tLockEvent event;
    bool locked;
    int64_t stepNs;
    double inForcePpb;
    int64_t steps, locksLost;
};

void expectSteps(tDiscipline& discipline, tScene& scene, const std::vector<tStepRow>& rows)
{
    for (const tStepRow& row : rows) {
        SCOPED_TRACE(testing::Message() << "row " << &row - rows.data());
        const tStep step = discipline.take(scene.second(row.what));
        EXPECT_EQ(scene.pair.clockNs, step.pair.clockNs);
        EXPECT_EQ(row.event, step.event);
        EXPECT_EQ(row.locked, step.locked);
        EXPECT_NEAR(row.stepNs, step.stepNs, 10); // whole ppb leave a few ns
        EXPECT_NEAR(row.inForcePpb, step.inForcePpb, 2);
        EXPECT_EQ(row.steps, step.steps);
        EXPECT_EQ(row.locksLost, step.locksLost);
    }
}

TEST(Discipline, tellsWhatBecameOfEachPair)
{
    tScene scene;
    scene.clock.setOffsetPpb(1000); // left by somebody else
    const tDisciplineOptions options;
    tDiscipline discipline(library(), scene.clock, options);
    EXPECT_NE(nullptr, findCall(discipline.firstCalls(), kGetMaxFrequencyOffset));
    const double back = -20'000; // what takes the oscillator's error out
    expectSteps(discipline, scene,
                {{'.', kNothingNew, false, 0, 1000, 0, 0},
                 {'.', kFrequencyMeasured, false, 0, back, 0, 0},
                 {'.', kStepped, false, -3'042'000, back, 1, 0},
                 {'.', kLockGained, true, 0, back, 1, 0},
                 {'.', kNothingNew, true, 0, back, 1, 0},
                 {'u', kLockLost, false, 0, back, 1, 1},
                 {'.', kNothingNew, false, 0, back, 1, 1},
                 {'m', kFrequencyAtLimit, false, 0, -100'000, 1, 1},
                 {'.', kNothingNew, false, 0, -100'000, 1, 1},
                 {'.', kFrequencyMeasured, false, 0, back, 1, 1},
                 {'.', kStepped, false, -842'000, back, 2, 1},
                 {'.', kLockGained, true, 0, back, 2, 1}});
    discipline.clearHistory(); // a lock lost
    discipline.clearHistory(); // which is none
    expectSteps(discipline, scene,
                {{'.', kNothingNew, false, 0, back, 2, 2},
                 {'.', kFrequencyMeasured, false, 0, back, 2, 2},
                 {'.', kNotStepped, false, 0, back, 2, 2},
                 {'u', kLockMissed, false, 0, back, 2, 2}});
}

// The order of each pair from the second on fails in turn.
TEST(Discipline, keepsWhatWasAskedBeforeAFailure)
{
    for (int n = 1; n <= 4; ++n) {
        SCOPED_TRACE(testing::Message() << "order " << n);
        tScene scene;
        scene.clock.failsAt = n;
        const tDisciplineOptions options;
        tDiscipline discipline(library(), scene.clock, options);
        for (int i = 0; i < n; ++i)
            EXPECT_FALSE(discipline.take(scene.second()).failure);
        const tStep step = discipline.take(scene.second());
        EXPECT_TRUE(step.failure);
        EXPECT_EQ(n != 2, findCall(step.calls, kGetFrequency) != nullptr); // 2 is the step
        EXPECT_EQ(kNothingNew, step.event);
        EXPECT_EQ(scene.clock.offsetPpb(), step.inForcePpb);
        EXPECT_EQ(n > 2 ? 1 : 0, step.steps);
        EXPECT_EQ(n > 3, step.locked);
    }
}

// Pairs held back are '-'; a measurement is of two pairs, at least four seconds apart.
TEST(Discipline, spacesEveryMeasurement)
{
    tScene scene;
    tDisciplineOptions options;
    options.measureOverNs = 4 * kSecondNs;
    tDiscipline discipline(library(), scene.clock, options);
    const auto heldBack = [&](const char* script) {
        std::string marks;
        for (; *script != '\0'; ++script)
            marks += discipline.take(scene.second(*script)).heldBack ? '-' : *script;
        return marks;
    };
    EXPECT_EQ(".---....", heldBack("........"));
    EXPECT_EQ("u.---...", heldBack("u......."));           // a lock lost: that pair is spent
    EXPECT_EQ("u.---..u.---.", heldBack("u......u.....")); // a lock missed
    discipline.clearHistory();
    EXPECT_EQ(".-", heldBack(".."));
    discipline.clearHistory();
    EXPECT_EQ(".---m.---.", heldBack("....m.....")); // out of reach
}

// The threshold in force shows in whether the third pair's 3 ms are stepped.
TEST(Discipline, isTunedAnewAsAWholeOrNotAtAll)
{
    const tTestFile config("config.json", R"({"snapTimeThreshold": 1})");
    tScene scene;
    tDisciplineOptions options;
    options.tuning.configFile = config.path;
    tDiscipline discipline(library(), scene.clock, options);
    const auto eventOfThird = [&] {
        discipline.clearHistory();
        discipline.take(scene.second());
        discipline.take(scene.second());
        return discipline.take(scene.second()).event;
    };
    EXPECT_EQ(kNotStepped, eventOfThird());
    for (const char* const refused :
         {R"({"snapTimeThreshold": 1e-6, "spikeFilterGrowthFactor": 0})",
          R"({"snapTimeThreshold": 1.5})"}) { // too wide for the resolution that goes with 1 s
        writeText(config.path, refused);
        EXPECT_THROW(discipline.retune(), std::runtime_error);
    }
    EXPECT_EQ(kNotStepped, eventOfThird());
    writeText(config.path, R"({"phaseLockGain": 0.1})");
    discipline.retune();
    EXPECT_EQ(kStepped, eventOfThird()); // what stood there before is gone
}

TEST(Discipline, appliesLaterDocumentsAnewWhenTunedAnew)
{
    const tTestFile quiet("quiet.json", R"({"snapTimeThreshold": 1, "gain": 2})");
    tScene scene;
    tDisciplineOptions options;
    options.later = {{2 * kSecondNs, quiet.path}};
    tDiscipline discipline(library(), scene.clock, options);
    for (const char* marks : {"-----t-", "t-"}) { // in a lock from the fourth pair on
        EXPECT_EQ(tNotes{quiet.path + ": gain is not a key and sets nothing"}, discipline.retune());
        EXPECT_EQ(1U, discipline.notes().size());
        for (; *marks != '\0'; ++marks)
            EXPECT_EQ(*marks == 't', !discipline.take(scene.second()).tuning.empty()) << marks;
    }
    discipline.clearHistory(); // out of the lock the first tuning is back
    EXPECT_EQ("tuned as at the start", discipline.take(scene.second()).tuning);
    EXPECT_EQ("", discipline.take(scene.second()).tuning);
    EXPECT_EQ(kStepped, discipline.take(scene.second('m')).event);
}

TEST(MeanOrders, areInForceWhilePairsAreMissing)
{
    tMeanOrders orders;
    for (int i = 0; i < 7; ++i)
        orders.add(stepAt(i, 10, true, 1000));
    EXPECT_FALSE(orders.orderFor(nsOfSeconds(60))); // too few are known
    for (int i = 7; i < 40; ++i)
        orders.add(stepAt(i, int64_t{10} * i, true, 1000 * (i % 2)));
    EXPECT_FALSE(orders.resume(0.5));
    EXPECT_FALSE(orders.orderFor(nsOfSeconds(40.4)));
    EXPECT_EQ(500, orders.orderFor(nsOfSeconds(40.5)));
    EXPECT_FALSE(orders.orderFor(nsOfSeconds(41)));
    EXPECT_EQ(500 - 0.5 * 390, orders.resume(0.5)); // what the last error had added
    EXPECT_FALSE(orders.resume(0.5));
    orders.add(stepAt(60, 10, false, 0)); // the lock is lost
    EXPECT_FALSE(orders.orderFor(nsOfSeconds(90)));
}

// Each clock as theory has it, with noise of its own, behind the one before.
TEST(SimulatedChain, hasTheErrorOfTheoryAtEachClock)
{
    const tTestFile document("chain.json", R"({"phaseLockGain": 0.2, "phaseLockCoefficientA": 1.05,
                                               "snapTimeThreshold": 1e-5})");
    tDisciplineOptions options;
    options.maxFrequencyOffsetPpb = 500'000;
    options.tuning.configFile = document.path;
    tPhase phase;
    phase.oscillator.frequencyWanderPpb = 1;
    phase.measurement.noiseNs = 50;
    phase.measurement.intervalNs = kSecondNs;
    phase.measurement.durationNs = 20'000 * kSecondNs;
    tSimulatedChain chain(library(), {phase}, 4, 1, options);
    tDiscipline last(library(), chain.lastClock(), options);
    while (const auto moment = chain.next())
        last.take(*moment->pair);
    std::istringstream remarks(chain.remarks());
    std::string word;
    remarks >> word >> word;
    int hop = 0;
    for (double foundNs = 0; remarks >> foundNs >> word;) {
        const double ns = 50 * std::sqrt(chainVariance({0, 4e-4}, {0.2, 0.01}, ++hop));
        EXPECT_NEAR(ns, foundNs, 0.08 * ns) << hop;
    }
    EXPECT_EQ(4, hop) << chain.remarks();
}

} // namespace
