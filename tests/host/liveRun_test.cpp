#include "host/scene.h"
#include "loop/tLiveRun.h"

using namespace dravikHost;

namespace {

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
    void run(const std::string& script)
    {
        scene.script = script.c_str();
        tLiveRun(library(), scene.clock, signals, options, *this).run("live", scene);
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
    {".H..", "6 documents read again\n"}};

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
    live.options.discipline.factor = 1; // whole ppb keep the frequency unsure
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

struct tGuardRow {
    std::optional<int64_t> maxStepNs;
    bool noStepAfterLock, dryRun;
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
    {{}, true, false, "....u...", "refused a step of -2 us after the first lock", 4},
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
        EXPECT_EQ(live.scene.clock.offsetPpb(), live.latest.inForcePpb);
    }
}

} // namespace
