#include "loop/tLiveRun.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <stdexcept>

namespace dravikHost {

tLiveRun::tLiveRun(const tServoLibrary& library, iClock& clock, tSignals& signals,
                   const tLiveRunOptions& options, iStepObserver& observers)
    : signals(signals), options(options), observers(observers),
      guarded(
          clock, [this](int64_t deltaNs) { requireStep(deltaNs); }, options.discipline.dryRun),
      discipline(library, guarded, options.discipline), sanity(options.sanityLimitPpb)
{}

void tLiveRun::run(const std::string& scenario, iLiveSource& source)
{
    observers.begin(scenario, discipline.firstCalls());
    while (const auto moment = source.next()) {
        if (signals.takeReload()) reload(moment->elapsedNs);
        if (moment->pair) {
            take(*moment->pair);
        } else {
            silence(moment->elapsedNs);
        }
    }
    observers.end(source.remarks());
}

// A step that a guard refuses ends the run: so large an offset is for a person to judge.
void tLiveRun::requireStep(int64_t deltaNs) const
{
    if (options.maxStepNs && (deltaNs > *options.maxStepNs || deltaNs < -*options.maxStepNs)) {
        throw std::runtime_error(fmt::format("refused a step of {}: --max-step is {}",
                                             signedDurationText(deltaNs),
                                             durationText(*options.maxStepNs)));
    }
    if (options.noStepAfterLock && hadLock) {
        throw std::runtime_error(
            fmt::format("refused a step of {} after the first lock", signedDurationText(deltaNs)));
    }
}

void tLiveRun::take(const tPair& pair)
{
    endSilence(pair);
    checkSanity(pair);
    const tStep step = discipline.take(pair);
    hadLock = hadLock || step.locked;
    steppedNs += step.stepNs;
    estimate.see(step);
    show(step, observers);
}

// What was measured before a long silence says nothing of the clock after it.
void tLiveRun::endSilence(const tPair& pair)
{
    const bool isBack = isSilent && latestNs;
    const int64_t lengthNs = pair.elapsedNs - latestNs.value_or(0);
    latestNs = pair.elapsedNs;
    isSilent = false;
    if (!isBack) return;
    const bool tooLong = lengthNs >= options.longHoldoverNs;
    observers.note(pair.elapsedNs,
                   fmt::format("reference is back after {}{}", durationText(lengthNs),
                               tooLong ? ": measuring anew" : ""));
    if (tooLong) discipline.clearHistory();
}

void tLiveRun::checkSanity(const tPair& pair)
{
    const std::string wrong = sanity.look(pair, steppedNs);
    if (wrong.empty()) return;
    observers.note(pair.elapsedNs, wrong + ": measuring anew");
    discipline.clearHistory();
}

void tLiveRun::silence(int64_t elapsedNs)
{
    const int64_t lengthNs = elapsedNs - latestNs.value_or(0);
    if (!isSilent && lengthNs >= options.silenceNs) {
        isSilent = true;
        observers.note(elapsedNs, latestNs ? "reference is silent: holding the frequency"
                                           : "no sample from the reference yet");
    }
    const bool inHoldover = isSilent && latestNs;
    observers.see(inHoldover ? tSilence{elapsedNs, lengthNs, estimate.errorNs(lengthNs)}
                             : tSilence{elapsedNs, {}, {}});
}

void tLiveRun::reload(int64_t elapsedNs)
{
    try {
        discipline.retune();
        observers.note(elapsedNs, "documents read again");
    } catch (const std::runtime_error& failure) {
        observers.note(elapsedNs, fmt::format("documents stay as they are: {}", failure.what()));
    }
}

} // namespace dravikHost
