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
        throw std::runtime_error(fmt::format("a step by {} is larger than --max-step allows, {}",
                                             signedDurationText(deltaNs),
                                             signedDurationText(*options.maxStepNs)));
    }
    if (options.noStepAfterLock && hadLock) {
        throw std::runtime_error(
            fmt::format("a step by {} after the first lock", signedDurationText(deltaNs)));
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
    const int64_t lengthNs = pair.elapsedNs - latestNs;
    latestNs = pair.elapsedNs;
    if (!inHoldover) return;
    inHoldover = false;
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
    const int64_t lengthNs = elapsedNs - latestNs;
    if (!inHoldover && lengthNs >= options.silenceNs) {
        inHoldover = true;
        observers.note(elapsedNs, "reference is silent: holding the frequency");
    }
    tSilence silence{elapsedNs, {}, {}};
    if (inHoldover) silence = {elapsedNs, lengthNs, estimate.errorNs(lengthNs)};
    observers.see(silence);
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
