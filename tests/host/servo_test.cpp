#include "clocks/tSteeredClock.h"
#include "host/stepFixture.h"
#include "servo/configDocument.h"
#include "servo/tLockObserver.h"
#include "servo/tServoHost.h"
#include "servo/tStatus.h"

#include <map>

using namespace dravikHost;

namespace {

// What the plug-in did for one pair: s sets an offset inside the limits, u one just inside the
// upper limit, U and L set the upper and the lower one, j steps, b steps and sets, - does nothing.
const std::map<char, tHostCalls> kDeeds = {
    {'s', {{kGetTime, 5}, {kSetFrequency}}},  {'u', {{kSetFrequency, 0, 199}}},
    {'l', {{kSetFrequency, 0, -99}}},         {'U', {{kSetFrequency, 0, 200}}},
    {'L', {{kSetFrequency, 0, -100}}},        {'j', {{kGetTime, 5}, {kStepTime, 5}}},
    {'b', {{kStepTime, 5}, {kSetFrequency}}}, {'-', {{kGetTime, 5}}}};

// Events by a letter each: nothing new (.), Measured, At the limit, Stepped, Not stepped, Gained,
// missed (X), Lost.
TEST(LockObserver, infersTheStateFromTheCalls)
{
    constexpr const char* kLetters = ".MASNGXL";
    const struct {
        const char *deeds, *events, *states; // - measuring, = between, + locked
    } kRows[] = {
        {"-sjss-ss", ".MSG.LMG", "-==++-=+"}, // by a step
        {"s-s--", "MNGL.", "==+--"},          // near enough without
        {"sj-", "MSX", "==-"},                // too far off after the step
        {"s--", "MNX", "==-"},                // and without one
        {"u-s", "MNG", "==+"},                // just inside the limits
        {"l-s", "MNG", "==+"},                //
        {"U-L-", "A.A.", "----"},             // measured over and over
        {"UL", "AG", "-+"},                   // two pairs in a row that set it are phase lock
        {"ss", "MG", "=+"},                   //
        {"Ujs", "ASG", "-=+"},                // a step is always a snap
        {"sjsjs", "MSGSG", "==+=+"},          // out of the lock, too
        {"sjU", "MSG", "==+"},                // limits count only while it measures
        {"bbb", "MG.", "=++"},                // what is set counts more than a step
        {"srs-rs", "M.MN.M", "=-==-="},       // r: the plug-in's history is cleared
        {"sjsrUU", "MSG.AG", "==+--+"},       //
    };
    for (const auto& row : kRows) {
        tLockObserver observer(-100, 200);
        std::string events;
        std::string states;
        for (const char* deed = row.deeds; *deed != '\0'; ++deed) {
            if (*deed == 'r') observer.restart();
            events += *deed == 'r' ? '.' : kLetters[observer.observe(kDeeds.at(*deed))];
            states += observer.locked() ? '+' : observer.measuring() ? '-' : '=';
        }
        EXPECT_EQ(row.events, events) << row.deeds;
        EXPECT_EQ(row.states, states) << row.deeds;
    }
}

struct ServoHost : testing::Test {
    tSteeredClock clock{1'000'000'000'000, 0, 100'000};
};

std::string told(const tHostCalls& calls)
{
    std::string text;
    for (const tHostCall& call : calls) {
        const double value =
            isOfFrequency(call.operation) ? call.ppb : static_cast<double>(call.ns);
        text += std::string(kHostOperationNames[call.operation]) + " " + decimalText(value) + "; ";
    }
    return text;
}

TEST_F(ServoHost, notesWhatThePlugInDoesToTheClock)
{
    tServoHost host(library(), clock);
    const struct {
        uint64_t referenceNs, clockNs;
        const char* calls;
    } kPairs[] = {{10'000'000'000, 13'000'000'000, ""},
                  {11'000'000'000, 14'000'002'000, "getFrequency 0; setFrequency -2000; "},
                  {12'000'000'000, 15'000'000'000, "stepTime -3000000000; "}};
    for (const auto& pair : kPairs) {
        host.adjustTime(pair.referenceNs, pair.clockNs);
        EXPECT_EQ(pair.calls, told(host.calls()));
    }
    host.clearHistory();
    host.adjustTime(20'000'000'000, 20'000'000'000);
    EXPECT_EQ(nullptr, findCall(host.calls(), kSetFrequency));
}

// A clock whose orders fail, and that may work for another servo meanwhile.
class tBusyClock : public tSteeredClock
{
public:
    tBusyClock() : tSteeredClock(0, 0, 100'000) {}

    void setOffsetPpb(double offsetPpb) override
    {
        if (other != nullptr) other->adjustTime(1, 1);
        if (broken) throw std::runtime_error("a \"loose\" wire");
        tSteeredClock::setOffsetPpb(offsetPpb);
    }
    void step(int64_t /*deltaNs*/) override { throw 1; }

    tServoHost* other = nullptr;
    bool broken = false;
};

TEST_F(ServoHost, passesOnWhyTheClockFailed)
{
    tBusyClock busy;
    tServoHost other(library(), clock);
    tServoHost host(library(), busy);
    host.adjustTime(1'000'000'000, 1'000'000'000);
    busy.broken = true;
    EXPECT_EQ("a \"loose\" wire",
              failureOf([&] { host.adjustTime(2'000'000'000, 2'000'000'100); }));
    EXPECT_EQ("getFrequency 0; ", told(host.calls()));
    busy.broken = false;
    busy.other = &other;
    host.adjustTime(3'000'000'000, 3'000'000'100);
    EXPECT_EQ("getFrequency 0; setFrequency -50; ", told(host.calls()));
    EXPECT_EQ("", told(other.calls()));
    EXPECT_EQ("adjustTime failed with -1: {\"message\": \"unknown failure of the clock\"}",
              failureOf([&] { host.adjustTime(4'000'000'000, 5'000'000'000); }));
}

TEST_F(ServoHost, readsBackItsParameters)
{
    tServoHost host(library(), clock);
    tServoParameters parameters;
    EXPECT_EQ(parameters.documentText(), tServoParameters::of(host.readConfig()).documentText());
    parameters.phaseLockGain = 0.123456789;
    parameters.phaseLockCoefficientA = 1.00000012345678;
    parameters.spikeFilterEnabled = 1;
    host.writeConfig(parameters.documentText());
    const tServoParameters inForce = tServoParameters::of(host.readConfig());
    EXPECT_EQ(0.123457, inForce.phaseLockGain);
    EXPECT_EQ(1.00000012346, inForce.phaseLockCoefficientA);
    EXPECT_EQ(1, inForce.spikeFilterEnabled);
    EXPECT_EQ("the plug-in's document has no frequencyLockGain",
              failureOf([] { tServoParameters::of(R"({"frequencyLockGain": "1"})"); }));
    EXPECT_EQ(100, withinBounds(zvckmservo_kSpikeFilterHistorySize, 1e3));
    EXPECT_EQ(-10, withinBounds(zvckmservo_kPhaseLockCoefficientC, -11));
}

TEST(Refusal, showsAPayloadThatSaysNoPlace)
{
    for (const char* const payload :
         {"no details", R"({"file": "dravik/tServo"})", R"({"file": "dravik/tServo", "line": "1"})",
          R"({"line": 1})", R"({"file": 1, "line": 1})"})
        EXPECT_EQ(payload, refusalText(R"({"phaseLockGain": 20})", payload));
}

TEST(Status, keepsTheFirstFailure)
{
    tStatus status;
    EXPECT_EQ("no details", status.details());
    status.check("nothing");
    const std::string reason(300, 'x');
    setFailure(&status, -7, reason.c_str());
    setFailure(&status, -8, "later");
    EXPECT_EQ("it failed with -7: {\"message\": \"" + reason + "\"}",
              failureOf([&] { status.check("it"); }));
}

} // namespace
