#include "loop/tDiscipline.h"

#include "clocks/tSteeredClock.h"

namespace dravikHost {

tDiscipline::tDiscipline(const tServoLibrary& library, iClock& clock,
                         const tDisciplineOptions& options)
    : library(library), options(options), host(library, clock), callsThatMadeIt(host.calls()),
      lock(clock.minOffsetPpb(), clock.maxOffsetPpb()), spacing(options.measureOverNs),
      tuningNotes(tune(host, options.tuning)), later(host, options.later),
      inForcePpb(clock.offsetPpb())
{
    tuningNotes.insert(tuningNotes.end(), later.notes().begin(), later.notes().end());
}

tStep tDiscipline::take(const tPair& pair)
{
    tStep step;
    step.pair = pair;
    step.dryRun = options.dryRun;
    step.heldBack = spacing.holdsBack(pair.elapsedNs);
    if (!step.heldBack) hand(pair, step);
    step.locked = lock.locked();
    step.inForcePpb = inForcePpb;
    step.steps = steps;
    step.locksLost = locksLost;
    return step;
}

// What the clock was asked is part of the step also if the plug-in then failed.
void tDiscipline::hand(const tPair& pair, tStep& step)
{
    try {
        host.adjustTime(pair.referenceNs, pair.clockNs);
    } catch (...) {
        step.failure = std::current_exception();
    }
    step.calls = host.calls();
    followOrders(step);
    if (step.failure) return;
    step.event = lock.observe(step.calls);
    spacing.given(pair.elapsedNs, step.event, lock.measuring());
    if (step.event == kLockLost) ++locksLost;
    step.tuning = later.observe(host, pair.elapsedNs, lock.locked());
}

void tDiscipline::followOrders(tStep& step)
{
    if (options.dryRun) return;
    for (const tHostCall& call : step.calls) {
        if (call.operation == kSetFrequency) inForcePpb = call.ppb;
        if (call.operation != kStepTime) continue;
        step.stepNs += call.ns;
        ++steps;
    }
}

void tDiscipline::clearHistory()
{
    host.clearHistory();
    if (lock.locked()) ++locksLost;
    lock.restart();
    spacing.restart();
}

tNotes tDiscipline::retune()
{
    tStillClock still;
    tServoHost trial(library, still);
    tNotes notes = tune(trial, options.tuning);
    tLaterDocuments anew(trial, options.later);
    notes.insert(notes.end(), anew.notes().begin(), anew.notes().end());
    host.writeConfig(trial.readConfig()); // all keys: what is no longer in a document goes back
    anew.takeOver(later);
    later = anew;
    return notes;
}

void begin(const tDiscipline& discipline, const std::string& scenario, iStepObserver& observers)
{
    observers.begin(scenario, discipline.firstCalls());
    for (const std::string& note : discipline.notes())
        observers.note(0, note);
}

void disciplineAll(tDiscipline& discipline, iPairSource& source, const std::string& scenario,
                   iStepObserver& observers)
{
    begin(discipline, scenario, observers);
    std::exception_ptr failure;
    try {
        while (const auto pair = source.next())
            show(discipline.take(*pair), observers);
    } catch (...) {
        failure = std::current_exception();
    }
    observers.end("");
    if (failure) std::rethrow_exception(failure);
}

void show(const tStep& step, iStepObserver& observers)
{
    observers.see(step);
    if (step.failure) std::rethrow_exception(step.failure);
}

} // namespace dravikHost
