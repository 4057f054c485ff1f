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

void tLiveRun::run(const std::string& scenario, iPairSource& source)
{
    begin(discipline, scenario, observers);
    std::exception_ptr failure;
    try {
        while (const auto moment = source.next()) {
            if (signals.takeReload()) reload(moment->elapsedNs);
            leftOut = moment->leftOut;
            if (moment->pair) {
                take(*moment->pair);
            } else {
                silence(moment->elapsedNs);
            }
        }
    } catch (...) { // people see the end of a run that fails too
        failure = std::current_exception();
    }
    observers.end(source.remarks());
    if (failure) std::rethrow_exception(failure);
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
    tStep step = discipline.take(pair);
    step.leftOut = leftOut;
    hadLock = hadLock || step.locked;
    steppedNs += step.stepNs;
    estimate.add(step);
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
    tSilence silence = discipline.wait(elapsedNs);
    silence.leftOut = leftOut;
    if (isSilent && latestNs) {
        silence.holdoverNs = lengthNs;
        silence.errorNs = estimate.errorNs(lengthNs);
    }
    observers.see(silence);
}

void tLiveRun::reload(int64_t elapsedNs)
{
    try {
        const tNotes notes = discipline.retune();
        observers.note(elapsedNs, "documents read again");
        for (const std::string& note : notes)
            observers.note(elapsedNs, note);
    } catch (const std::runtime_error& failure) {
        observers.note(elapsedNs, fmt::format("documents stay as they are: {}", failure.what()));
    }
}

} // namespace dravikHost
