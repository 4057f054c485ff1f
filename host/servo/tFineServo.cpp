#include "servo/tFineServo.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <stdexcept>

namespace dravikHost {

namespace {

constexpr double kPerPpb = 1e-9;

// So the rate of the clock that is shown stays well above zero.
constexpr double kWidestShownPpb = 9e8;

constexpr const zvckmservo_Parameter& kSnap = zvckmservo_parameters[zvckmservo_kSnapTimeThreshold];

int64_t elapsed(uint64_t fromNs, uint64_t toNs) { return static_cast<int64_t>(toNs - fromNs); }

// Infinite for a clock that did not move.
double rateOver(int64_t referenceNs, int64_t clockNs)
{
    const auto passed = static_cast<double>(referenceNs);
    if (clockNs == 0) return std::copysign(std::numeric_limits<double>::infinity(), passed);
    return passed / static_cast<double>(clockNs);
}

} // namespace

int tFineServo::factorFor(int atMost, double limitPpb, double snapTimeThreshold)
{
    int factor = atMost;
    while (factor > 1 &&
           (factor * limitPpb > kWidestShownPpb || factor * snapTimeThreshold > kSnap.highest))
        factor /= 2;
    return factor;
}

double tFineServo::limitOf(iClock& clock)
{
    return std::max<double>(clock.maxOffsetPpb(), -static_cast<double>(clock.minOffsetPpb()));
}

tFineServo::tFineServo(const tServoLibrary& library, iClock& clock, int factor,
                       const tServoParameters& parameters)
    : enlarged(clock, factor), host(library, enlarged),
      lock(clock.minOffsetPpb(), clock.maxOffsetPpb())
{
    noteCalls();
    writeParameters(parameters);
}

void tFineServo::requireThreshold(double snapTimeThreshold) const
{
    if (factor() * snapTimeThreshold <= kSnap.highest) return;
    throw std::runtime_error(fmt::format(
        "a snapTimeThreshold of {} s does not go with the resolution of {} ppb that this "
        "run has; at most {} s does",
        snapTimeThreshold, 1.0 / factor(), kSnap.highest / factor()));
}

void tFineServo::writeParameters(const tServoParameters& parameters)
{
    requireThreshold(parameters.snapTimeThreshold);
    tServoParameters shown = parameters;
    shown.snapTimeThreshold *= factor();
    shown.spikeFilterMaxThreshold = withinBounds(zvckmservo_kSpikeFilterMaxThreshold,
                                                 factor() * parameters.spikeFilterMaxThreshold);
    shown.spikeFilterMinThreshold = withinBounds(zvckmservo_kSpikeFilterMinThreshold,
                                                 factor() * parameters.spikeFilterMinThreshold);
    host.writeConfig(shown.exactText());
    inForce = parameters;
}

// Of a measurement that is none, as neither clock moved, the plug-in makes 0 ppb, and measures
// anew.
tLockEvent tFineServo::adjustTime(uint64_t referenceNs, uint64_t clockNs)
{
    realCalls.clear();
    enlarged.correctionNs = elapsed(clockNs, referenceNs);
    const tShown plain = show(referenceNs, clockNs);
    if (first && enlarged.factor > 1) {
        const auto second = showSecond(referenceNs, clockNs);
        handOver(second.value_or(first->shown));
        if (!second) {
            lock.restart();
            first.reset();
            return kFrequencyAtLimit;
        }
    } else {
        handOver(plain);
    }
    const tLockEvent event = lock.observe(realCalls);
    if (lock.measuring() && event == kNothingNew) {
        first = {referenceNs, clockNs, plain};
    } else {
        first.reset();
    }
    return event;
}

void tFineServo::clearHistory()
{
    host.clearHistory();
    lock.restart();
    first.reset();
}

// A clock may be wrong by decades, so the enlarged error has a limit, and the clock that is shown
// room below.
tFineServo::tShown tFineServo::show(uint64_t referenceNs, uint64_t clockNs)
{
    if (enlarged.factor == 1) return {referenceNs, clockNs};
    constexpr uint64_t kOriginNs = uint64_t{1} << 62U;
    constexpr int64_t kWidestNs = int64_t{1} << 61U;
    if (!originNs) originNs = referenceNs;
    const uint64_t shownNs = kOriginNs + (referenceNs - *originNs);
    const int64_t widestNs = kWidestNs / enlarged.factor;
    const int64_t errorNs = std::clamp(elapsed(referenceNs, clockNs), -widestNs, widestNs);
    return {shownNs, shownNs + static_cast<uint64_t>(errorNs * enlarged.factor)};
}

// The plug-in sets its ratio times rate and gain, where the rate is elapsed reference over elapsed
// clock. The ratio that is wanted is not proportional to the error, so the two times are made such
// that the enlarged offset comes out. It is never one of the limits themselves, at which nobody
// could tell whether the measurement counts. Nothing if neither clock moved.
std::optional<tFineServo::tShown> tFineServo::showSecond(uint64_t referenceNs, uint64_t clockNs)
{
    const int64_t referenceElapsedNs = elapsed(first->referenceNs, referenceNs);
    const int64_t clockElapsedNs = elapsed(first->clockNs, clockNs);
    if (referenceElapsedNs == 0 && clockElapsedNs == 0) return std::nullopt;
    const double inForcePpb = enlarged.clock.offsetPpb();
    const double ratio = (1 + inForcePpb * kPerPpb) * rateOver(referenceElapsedNs, clockElapsedNs) *
                         inForce.frequencyLockGain;
    const double lowest = enlarged.minOffsetPpb();
    const double highest = enlarged.maxOffsetPpb();
    const double wanted = std::round(enlarged.factor * ((ratio - 1) / kPerPpb));
    const double target = wanted > highest  ? highest + 1
                          : wanted < lowest ? lowest - 1
                                            : std::max(std::min(wanted, highest - 1), lowest + 1);
    const double rate = (1 + target * kPerPpb) / (1 + enlarged.enlarged(inForcePpb) * kPerPpb) /
                        inForce.frequencyLockGain;
    constexpr double kLongNs = 1e18; // for the digits of the quotient
    const auto passed = [](double ns) { return static_cast<uint64_t>(std::llround(ns)); };
    return tShown{first->shown.referenceNs + passed(rate < 1 ? kLongNs * rate : kLongNs),
                  first->shown.clockNs + passed(rate < 1 ? kLongNs : kLongNs / rate)};
}

void tFineServo::handOver(const tShown& shown)
{
    try {
        host.adjustTime(shown.referenceNs, shown.clockNs);
    } catch (...) {
        noteCalls();
        throw;
    }
    noteCalls();
}

void tFineServo::noteCalls()
{
    realCalls.clear();
    for (tHostCall call : host.calls()) {
        call.ppb /= enlarged.factor;
        if (call.operation == kStepTime) call.ns = enlarged.correctionNs;
        realCalls.push_back(call);
    }
}

// A step is always minus the error that was shown.
void tFineServo::tEnlargedClock::step(int64_t /*deltaNs*/) { clock.step(correctionNs); }

// In whole ppb, as it will be given to the plug-in.
double tFineServo::tEnlargedClock::enlarged(double realPpb) const
{
    if (factor == 1) return realPpb;
    return std::round(std::clamp(factor * realPpb, -kWidestShownPpb, kWidestShownPpb));
}

} // namespace dravikHost
