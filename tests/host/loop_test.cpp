#include "clocks/tSteeredClock.h"
#include "host/stepFixture.h"
#include "loop/tHoldoverEstimate.h"
#include "loop/tLiveRun.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <cmath>
#include <csignal>
#include <functional>
#include <stdexcept>

using namespace dravikHost;

namespace {

TEST(RunningFigures, keepTheirDigits)
{
    tRunningFigures figures;
    for (const double value : {figures.rmsNs(), figures.meanPpb(), figures.deviationPpb()})
        EXPECT_EQ(0, value);
    figures.add(pairAt(0, 3), 2e9 + 1);
    figures.add(pairAt(1, -4), 2e9 + 3);
    figures.add(pairAt(2, 0), 2e9 + 2);
    EXPECT_EQ(3, figures.count());
    EXPECT_DOUBLE_EQ(std::sqrt(25.0 / 3), figures.rmsNs());
    EXPECT_EQ(4, figures.peakNs());
    EXPECT_EQ(2e9 + 2, figures.meanPpb());
    EXPECT_DOUBLE_EQ(std::sqrt(2.0 / 3), figures.deviationPpb());
}

// Errors of 30 and -30 ns, frequencies of 4 and -4 ppb in turn, unless told otherwise.
void lockFor(int pairs, tHoldoverEstimate& estimate, double deviationPpb = 4)
{
    for (int i = 0; i < pairs; ++i) {
        const int sign = i % 2 == 0 ? 1 : -1;
        estimate.see(stepAt(i, 30 * sign, true, 5000 + deviationPpb * sign));
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
    estimate.see(stepAt(200, 5000, false, 5000));
    EXPECT_FALSE(estimate.errorNs(0));
    lockFor(7, estimate);
    EXPECT_FALSE(estimate.errorNs(0));
}

// A pair a second later each time, and a limit of 10 %: leaps of 101 ms are let pass, 1 ms of them
// as noise.
TEST(SanityCheck, findsLeapsButNotRatesAndOwnSteps)
{
    struct tRow {
        const char* name;
        int64_t referenceNs, clockNs; // by which they leap
        int64_t steppedNs;            // by the servo
        const char* wrong;
    };
    const char* const against = " against CLOCK_MONOTONIC_RAW";
    const tRow rows[] = {
        {"noise", 900'000, -900'000, 0, ""},
        {"just within the limit", 101'000'000, -101'000'000, 0, ""},
        {"reference forward", 101'100'000, 0, 0, "the reference leapt by +101.1 ms"},
        {"reference back", -5'000'000'000, 0, 0, "the reference leapt by -5 s"},
        {"clock forward", 0, 2'000'000'000, 0, "the clock leapt by +2 s"},
        {"clock back", 0, -101'100'000, 0, "the clock leapt by -101.1 ms"},
        {"the servo's step back", 0, -3'000'000'000, -3'000'000'000, ""},
        {"the servo's step forward", 0, 3'000'000'000, 3'000'000'000, ""},
        {"a step ordered, not made", 0, 0, 3'000'000'000, "the clock leapt by -3 s"},
    };
    tSanityCheck sanity(0.1e9);
    tPair pair = pairAt(0, 777);
    EXPECT_EQ("", sanity.look(pair, 0));
    int64_t steppedNs = 0;
    for (const tRow& row : rows) {
        pair.elapsedNs += nsOfSeconds(1);
        pair.referenceNs += static_cast<uint64_t>(nsOfSeconds(1) + row.referenceNs);
        pair.clockNs += static_cast<uint64_t>(nsOfSeconds(1) + row.clockNs);
        steppedNs += row.steppedNs;
        EXPECT_EQ(*row.wrong != '\0' ? std::string(row.wrong) + against : "",
                  sanity.look(pair, steppedNs))
            << row.name;
    }
}

const tServoLibrary& library()
{
    static const tServoLibrary loaded(tServoLibrary::find(""));
    return loaded;
}

TEST(LaterDocuments, areAppliedInALockAndGoWithIt)
{
    const tTestFile quiet("quiet.json", R"({"phaseLockGain": 0.1})");
    const tTestFile quieter("quieter.json", R"({"phaseLockGain": 0.01})");
    const std::string byQuiet = "tuned by " + quiet.path;
    const std::string byQuieter = "tuned by " + quieter.path;
    struct tRow {
        double atS;
        bool locked;
        std::string done;
        double gain; // from then on
    };
    const tRow rows[] = {{101, true, "", 0.5},          {110.9, true, "", 0.5},
                         {111, true, byQuiet, 0.1},     {120.9, true, "", 0.1},
                         {121, true, byQuieter, 0.01},  {151, false, "tuned as at the start", 0.5},
                         {152, false, "", 0.5},         {200, true, "", 0.5},
                         {209.9, true, "", 0.5},        {230, true, byQuiet, 0.1}, // one at a time
                         {230.1, true, byQuieter, 0.01}};
    tStillClock still;
    tServoHost servo(library(), still);
    servo.writeConfig(R"({"phaseLockGain": 0.5})");
    tLaterDocuments later(servo, {{nsOfSeconds(10), quiet.path}, {nsOfSeconds(20), quieter.path}});
    for (const tRow& row : rows) {
        EXPECT_EQ(row.done, later.observe(servo, nsOfSeconds(row.atS), row.locked)) << row.atS;
        const std::string gain = fmt::format("\"phaseLockGain\":\t{},", row.gain);
        EXPECT_NE(std::string::npos, servo.readConfig().find(gain)) << row.atS;
    }
    const tTestFile refused("refused.json", R"({"phaseLockGain": 0})");
    EXPECT_THROW(tLaterDocuments(servo, {{0, refused.path}}), std::runtime_error);
}

// A clock that counts its orders, and fails at one of them; the first is 1.
class tFailingClock : public tSteeredClock
{
public:
    using tSteeredClock::tSteeredClock;
    void step(int64_t deltaNs) override { order(), tSteeredClock::step(deltaNs); }
    void setOffsetPpb(int32_t ppb) override { order(), tSteeredClock::setOffsetPpb(ppb); }

    int orders = 0;
    int failsAt = 0;

private:
    void order()
    {
        if (++orders == failsAt) throw std::runtime_error("the clock is gone");
    }
};

// A clock 3 ms ahead, 20 ppm fast and steered within 100 ppm, beside a perfect reference. A second
// passes for each letter of the script; most are plain.
struct tScene : iLiveSource {
    tFailingClock clock{kStartNs + 3'000'000, 20'000, 100'000};
    tPair pair{0, kStartNs, kStartNs + 3'000'000, {}};
    const char* script = "";

    const tPair& second(char what = '.')
    {
        clock.pass(kSecondNs);
        if (what == 'u') clock.tSteeredClock::step(2000); // which ends a lock
        if (what == 'm') clock.tSteeredClock::step(1'000'000);
        if (what == 'd') clock.tSteeredClock::step(-100'000'000); // within the limit of sanity
        if (what == 'C') clock.tSteeredClock::step(-300'000'000);
        if (what == 'R') pair.referenceNs += 300'000'000;
        if (what == 'H') raise(SIGHUP);
        pair.elapsedNs += kSecondNs;
        pair.referenceNs += kSecondNs;
        pair.clockNs = clock.timeNs();
        return pair;
    }
    std::optional<tLiveMoment> next() override
    {
        if (*script == '\0') return std::nullopt;
        const bool silent = *script == '~';
        second(*script++);
        return tLiveMoment{pair.elapsedNs, silent ? std::nullopt : std::optional(pair)};
    }
    std::string remarks() const override { return "two left out"; }
};

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

TEST(Discipline, countsNothingAsDoneInADryRun)
{
    tScene scene;
    const auto allow = [](int64_t) {};
    tGuardedClock guarded(scene.clock, allow, true);
    tDisciplineOptions options;
    options.dryRun = true;
    tDiscipline discipline(library(), guarded, options);
    expectSteps(discipline, scene,
                {{'.', kNothingNew, false, 0, 0, 0, 0},
                 {'.', kFrequencyMeasured, false, 0, 0, 0, 0},
                 {'.', kStepped, false, 0, 0, 0, 0},
                 {'.', kLockMissed, false, 0, 0, 0, 0}});
    EXPECT_EQ(0, scene.clock.orders);
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
    writeText(config.path, R"({"snapTimeThreshold": 1e-6, "spikeFilterGrowthFactor": 0})");
    EXPECT_THROW(discipline.retune(), std::runtime_error);
    EXPECT_EQ(kNotStepped, eventOfThird());
    writeText(config.path, R"({"phaseLockGain": 0.1})");
    discipline.retune();
    EXPECT_EQ(kStepped, eventOfThird()); // what stood there before is gone
}

TEST(Discipline, appliesLaterDocumentsAnewWhenTunedAnew)
{
    const tTestFile quiet("quiet.json", R"({"snapTimeThreshold": 1})");
    tScene scene;
    tDisciplineOptions options;
    options.later = {{2 * kSecondNs, quiet.path}};
    tDiscipline discipline(library(), scene.clock, options);
    for (const char* marks : {"-----t-", "t-"}) { // in a lock from the fourth pair on
        discipline.retune();
        for (; *marks != '\0'; ++marks)
            EXPECT_EQ(*marks == 't', !discipline.take(scene.second()).tuning.empty()) << marks;
    }
    discipline.clearHistory(); // out of the lock the first tuning is back
    discipline.take(scene.second());
    discipline.take(scene.second());
    EXPECT_EQ(kStepped, discipline.take(scene.second('m')).event);
}

// A run, and what watchers are shown of it, a line each; pairs that change nothing are left out.
struct tLive : iStepObserver {
    tScene scene;
    tSignals signals;
    tLiveRunOptions options;
    std::string text;
    std::vector<tSilence> silences;
    tStep latest;

    tLive()
    {
        options.sanityLimitPpb = 0.2e9;
        options.silenceNs = 10 * kSecondNs;
        options.longHoldoverNs = 20 * kSecondNs;
    }
    void run(
        const std::string& script, const std::function<void()>& meanwhile = [] {})
    {
        scene.script = script.c_str();
        tLiveRun run(library(), scene.clock, signals, options, *this);
        meanwhile();
        run.run("live", scene);
    }
    void begin(const std::string& scenario, const tHostCalls& calls) override
    {
        text += scenario + (calls.empty() ? "\n" : " with calls\n");
    }
    void see(const tStep& step) override
    {
        const char* const events[] = {"",        "measured", "at limit", "stepped",
                                      "no step", "locked",   "missed",   "lost"};
        if (step.failure || step.event != kNothingNew)
            note(step.pair.elapsedNs, step.failure ? "failed" : events[step.event]);
        latest = step;
    }
    void see(const tSilence& silence) override { silences.push_back(silence); }
    void note(int64_t elapsedNs, const std::string& line) override
    {
        text += std::to_string(elapsedNs / kSecondNs) + " " + line + "\n";
    }
    void end(const std::string& remarks) override { text += "end: " + remarks + "\n"; }
};

struct tPolicyRow {
    const char* script; // from the fifth second on
    const char* lines;  // from then on
};
const tPolicyRow kPolicies[] = {
    {"~~~~~~~~~..", ""}, // too short to matter
    {"~~~~~~~~~~~~~~.~~~~~~~~~~~~.",
     "14 reference is silent: holding the frequency\n19 reference is back after 15 s\n"
     "29 reference is silent: holding the frequency\n32 reference is back after 13 s\n"},
    {"~~~~~~~~~~~~~~~~~~~....",
     "14 reference is silent: holding the frequency\n"
     "24 reference is back after 20 s: measuring anew\n25 measured\n26 no step\n27 locked\n"},
    {"R...", "5 the reference leapt by +300 ms against CLOCK_MONOTONIC_RAW: measuring anew\n"
             "6 measured\n7 stepped\n8 locked\n"},
    {"C...", "5 the clock leapt by -300 ms against CLOCK_MONOTONIC_RAW: measuring anew\n"
             "6 measured\n7 stepped\n8 locked\n"},
    {"d....", "5 lost\n7 measured\n8 stepped\n9 locked\n"}, // its own step is nobody's leap
    {".H..", "6 documents read again\n"},
};

TEST(LiveRun, hasAPolicyForWhatGoesWrong)
{
    for (const tPolicyRow& row : kPolicies) {
        tLive live;
        live.run(std::string("....") + row.script);
        EXPECT_EQ(std::string("live with calls\n2 measured\n3 stepped\n4 locked\n") + row.lines +
                      "end: two left out\n",
                  live.text);
    }
}

TEST(LiveRun, showsHowLongTheSilenceIs)
{
    tLive live;
    live.run("~~~~~~~~~~~~..............~~~~~~~~~~~.~~~~~~~~~~");
    EXPECT_EQ(0U, live.text.find("live with calls\n10 no sample from the reference yet\n"
                                 "14 measured\n"));
    const std::vector<tSilence>& silences = live.silences;
    ASSERT_EQ(33U, silences.size());
    EXPECT_FALSE(silences[11].holdoverNs); // there is nothing to hold yet
    EXPECT_FALSE(silences[20].holdoverNs); // 9 s
    EXPECT_EQ(36 * kSecondNs, silences[21].elapsedNs);
    EXPECT_EQ(10 * kSecondNs, silences[21].holdoverNs);
    EXPECT_EQ(11 * kSecondNs, silences[22].holdoverNs);
    EXPECT_LT(silences[21].errorNs, silences[22].errorNs);
    EXPECT_EQ(10 * kSecondNs, silences[32].holdoverNs); // counted from the pair in between
}

TEST(LiveRun, keepsItsTuningIfTheNewOneIsRefused)
{
    const tTestFile config("config.json", "{}");
    tLive live;
    live.options.discipline.tuning.configFile = config.path;
    live.run("....H.", [&config] { unlink(config.path.c_str()); });
    EXPECT_NE(std::string::npos,
              live.text.find("4 locked\n5 documents stay as they are: cannot read " + config.path +
                             ": No such file or directory\nend: "));
    EXPECT_TRUE(live.latest.locked);
}

struct tGuardRow {
    std::optional<int64_t> maxStepNs;
    bool noStepAfterLock;
    bool dryRun;
    const char* script;
    const char* refusal; // null if none
    int orders;          // that were made or tried
};
const tGuardRow kGuards[] = {
    {{}, false, false, "....u...", nullptr, 5},
    {3'200'000, false, false, "....u...", nullptr, 5},
    {1'000'000, false, false, "........", "refused a step of -3.04 ms: --max-step is 1 ms", 1},
    {1'000'000, false, true, "........", "refused a step of -3.06 ms: --max-step is 1 ms", 0},
    {3'200'000, false, false, "....d...", "refused a step of +100 ms: --max-step is 3.2 ms", 4},
    {{}, true, false, "....u...", "refused a step of -1.999 us after the first lock", 4},
    {{}, true, true, "........", nullptr, 0}, // in which there is no lock
};

TEST(LiveRun, endsRatherThanStep)
{
    for (const tGuardRow& row : kGuards) {
        tLive live;
        live.options.maxStepNs = row.maxStepNs;
        live.options.noStepAfterLock = row.noStepAfterLock;
        live.options.discipline.dryRun = row.dryRun;
        std::string reason;
        try {
            live.run(row.script);
        } catch (const std::runtime_error& failure) {
            reason = failure.what();
        }
        const bool refused = row.refusal != nullptr;
        EXPECT_EQ(refused, !reason.empty());
        EXPECT_NE(std::string::npos, reason.find(refused ? row.refusal : "")) << reason;
        EXPECT_EQ(refused, live.latest.failure != nullptr);
        EXPECT_EQ(row.orders, live.scene.clock.orders);
    }
}

} // namespace
