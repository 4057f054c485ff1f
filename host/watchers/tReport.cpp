#include "watchers/tReport.h"

#include "text/quantity.h"

#include <fmt/format.h>

namespace dravikHost {

namespace {

tHostCall callOf(const tHostCalls& calls, tHostOperation operation)
{
    const tHostCall* const call = findCall(calls, operation);
    return call != nullptr ? *call : tHostCall{operation};
}

std::string eventText(const tStep& step)
{
    const double orderedPpb = callOf(step.calls, kSetFrequency).ppb;
    const std::string error = signedDurationText(step.pair.errorNs());
    switch (step.event) {
    case kFrequencyMeasured: // the correction, the other way round, is how far it had been off
        return fmt::format("frequency measured: {} off, {} by {}",
                           offsetText(callOf(step.calls, kGetFrequency).ppb - orderedPpb),
                           step.dryRun ? "would be steered" : "now steered",
                           offsetText(orderedPpb));
    case kFrequencyAtLimit:
        return fmt::format("frequency at its limit, {}", offsetText(orderedPpb));
    case kStepped:
        return fmt::format("{} by {}", step.dryRun ? "would step" : "stepped",
                           signedDurationText(callOf(step.calls, kStepTime).ns));
    case kNotStepped:
        return fmt::format("no step needed, error {}", error);
    case kLockGained:
        return fmt::format("locked, error {}", error);
    case kLockMissed:
        return fmt::format("lock missed, error {}", error);
    case kLockLost:
        return fmt::format("lock lost, error {}", error);
    case kNothingNew:
        break;
    }
    return "";
}

} // namespace

void tReport::begin(const std::string& scenario, const tHostCalls& /*calls*/)
{
    console.print(scenario + "\n");
}

void tReport::see(const tStep& step)
{
    if (step.failure) return;
    const int64_t elapsedNs = step.pair.elapsedNs;
    if (step.event != kNothingNew) console.note(elapsedNs, eventText(step));
    if (!step.tuning.empty()) console.note(elapsedNs, step.tuning);
    console.progress(elapsedNs, [&step] {
        return fmt::format("{}, error {}", step.locked ? "locked" : "not locked",
                           signedDurationText(step.pair.errorNs()));
    });
}

void tReport::see(const tSilence& silence)
{
    if (!silence.holdoverNs) return;
    console.progress(silence.elapsedNs, [&silence] {
        return fmt::format("holdover for {}, error {}", durationText(*silence.holdoverNs),
                           silence.errorNs ? "about " + durationText(*silence.errorNs) : "unknown");
    });
}

void tReport::note(int64_t elapsedNs, const std::string& text) { console.note(elapsedNs, text); }

void tReport::end(const std::string& remarks)
{
    if (!remarks.empty()) console.print(remarks + "\n");
}

} // namespace dravikHost
