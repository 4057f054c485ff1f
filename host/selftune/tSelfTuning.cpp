#include "selftune/tSelfTuning.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <system_error>

namespace dravikHost {

namespace {

constexpr double kWhileAcquiring = 1e-6; // s: an error as large is stepped at the start
constexpr double kWhileLocked = 0.1;     // s: what is to be believed is decided here

} // namespace

tSelfTuning::tSelfTuning(tFineServo& servo, iClock& clock, int hops)
    : servo(servo), clock(clock), estimate(hops)
{
    restart();
}

void tSelfTuning::restart()
{
    estimate.restart();
    snapped = false;
    written.reset();
    writeDocument(tLoopGains::of({}), kWhileAcquiring);
}

bool tSelfTuning::prepare(int64_t elapsedNs, int64_t errorNs)
{
    ownOrders.clear();
    isCoasting = false;
    const double nowPpb = clock.offsetPpb(); // others may order it too
    estimate.steered(nowPpb - inForcePpb);
    inForcePpb = nowPpb;
    const tBelief before = estimate.belief();
    const auto event = estimate.take(elapsedNs, errorNs, written ? &*written : nullptr);
    noteText = textOf(event, before);
    if (event == tClockEstimate::kUseless) return false;
    if (!lawActs()) return true;
    constexpr double kPairsToReturn = 4;
    const double reachNs = kPairsToReturn * estimate.secondsPerPair() * clock.maxOffsetPpb() / 2;
    const bool isFar = std::fabs(estimate.phaseNs()) > reachNs;
    if (isFar) stepBack();
    if (isFar || event == tClockEstimate::kRejected || event == tClockEstimate::kOtherNoise) {
        order(wantedPpb());
        return false;
    }
    chooseGains();
    prepareLaw(errorNs);
    return true;
}

void tSelfTuning::follow(int64_t errorNs, tLockEvent event, const tHostCalls& calls)
{
    for (const tHostCall& call : calls)
        if (call.operation == kStepTime) estimate.stepped(call.ns);
    const double nowPpb = clock.offsetPpb();
    estimate.steered(nowPpb - inForcePpb);
    inForcePpb = nowPpb;
    if (event == kLockLost || event == kLockMissed) {
        restart();
        return;
    }
    snapped = event == kStepped || event == kNotStepped;
    lawErrorNs = servo.locked() ? static_cast<double>(errorNs) : 0;
}

bool tSelfTuning::coast(int64_t elapsedNs)
{
    constexpr double kLate = 1.5; // spacings
    ownOrders.clear();
    if (isCoasting || !servo.locked()) return false;
    if (estimate.secondsSincePair(elapsedNs) < kLate * estimate.secondsPerPair()) return false;
    estimate.wait(elapsedNs);
    try {
        order(inForcePpb - estimate.frequencyPpb());
    } catch (const std::system_error&) { // it may be silent itself; then it is asked again later
        return false;
    }
    isCoasting = true;
    return true;
}

// So that the clock is right when the next pair comes.
double tSelfTuning::wantedPpb() const
{
    return inForcePpb - estimate.frequencyPpb() - estimate.phaseNs() / estimate.secondsPerPair();
}

// A document is written for each pair while little is known, and later where the gains have been
// others for some pairs, not for one that was special.
void tSelfTuning::chooseGains()
{
    constexpr int64_t kYoung = 40; // pairs
    constexpr int kForGood = 8;
    const tKalmanFilter::tGains& gains = estimate.gains();
    const bool same =
        written && written->phase == gains.phase && written->frequency == gains.frequency;
    unlike = same ? 0 : unlike + 1;
    if (same || (written && estimate.pairs() > kYoung && unlike < kForGood)) return;
    constexpr double kMost = 50; // of each, which a document can have; the orders do the rest
    writeDocument({std::min(gains.phase / estimate.secondsPerPair(), kMost),
                   std::min(gains.frequency, kMost)},
                  kWhileLocked);
    written = gains;
    unlike = 0;
}

// What the law will make of the pair is known; where it is not what is wanted, it is made to begin
// elsewhere.
void tSelfTuning::prepareLaw(int64_t errorNs)
{
    constexpr double kShareOfKick = 0.02;
    constexpr double kLeastPpb = 0.01;
    const auto error = static_cast<double>(errorNs);
    const double change = (law.kp + law.ki) * error - law.kp * lawErrorNs; // downwards
    const double wanted = wantedPpb();
    const double mattersPpb = kShareOfKick * law.kp * estimate.belief().noiseNs;
    if (std::fabs(inForcePpb - change - wanted) > std::max(mattersPpb, kLeastPpb))
        order(wanted + change);
}

void tSelfTuning::order(double ppb)
{
    const double within = std::clamp<double>(ppb, clock.minOffsetPpb(), clock.maxOffsetPpb());
    clock.setOffsetPpb(within);
    const double nowPpb = clock.offsetPpb();
    ownOrders.push_back({kSetFrequency, 0, nowPpb});
    estimate.steered(nowPpb - inForcePpb);
    inForcePpb = nowPpb;
}

void tSelfTuning::stepBack()
{
    constexpr double kLargestNs = 0x1p62; // no clock is a century off
    const int64_t byNs = std::llround(std::clamp(-estimate.phaseNs(), -kLargestNs, kLargestNs));
    clock.step(byNs);
    ownOrders.push_back({kStepTime, byNs, 0});
    estimate.stepped(byNs);
}

void tSelfTuning::writeDocument(const tLoopGains& gains, double snapTimeThreshold)
{
    tServoParameters parameters;
    gains.putInto(parameters);
    parameters.snapTimeThreshold = snapTimeThreshold;
    servo.writeParameters(parameters);
    law = gains;
}

std::string tSelfTuning::textOf(tClockEstimate::tEvent event, const tBelief& before) const
{
    switch (event) {
    case tClockEstimate::kJumped:
        return fmt::format("the clock is found elsewhere by {}: followed",
                           signedDurationText(estimate.jumpNs()));
    case tClockEstimate::kJumpedBack:
        return "the clock is found where it was before: followed";
    case tClockEstimate::kOtherFrequency:
        return "the clock is found to run at another rate: followed";
    case tClockEstimate::kOtherNoise:
        return fmt::format("noise of {} in place of {}", durationText(estimate.belief().noiseNs),
                           durationText(before.noiseNs));
    default:
        return "";
    }
}

} // namespace dravikHost
