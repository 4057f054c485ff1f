#include "loop/tDiscipline.h"

#include "clocks/tSteeredClock.h"

namespace dravikHost {

namespace {

tServoHost& tuned(tServoHost& host, const tTuning& tuning)
{
    tune(host, tuning);
    return host;
}

} // namespace

tDiscipline::tDiscipline(const tServoLibrary& library, iClock& clock,
                         const tDisciplineOptions& options)
    : library(library), options(options), host(library, clock), callsThatMadeIt(host.calls()),
      lock(clock.minOffsetPpb(), clock.maxOffsetPpb()), spacing(options.measureOverNs),
      later(tuned(host, options.tuning), options.later), inForcePpb(clock.offsetPpb())
{}

tStep tDiscipline::take(const tPair& pair)
{
    tStep step;
    step.pair = pair;
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
        if (call.operation == kSetFrequency) inForcePpb = static_cast<double>(call.value);
        if (call.operation != kStepTime) continue;
        step.stepNs += call.value;
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

void tDiscipline::retune()
{
    tStillClock still;
    tServoHost trial(library, still);
    tune(trial, options.tuning);
    tLaterDocuments anew(trial, options.later);
    host.writeConfig(trial.readConfig()); // all keys: what is no longer in a document goes back
    anew.takeOver(later);
    later = anew;
}

void disciplineAll(tDiscipline& discipline, iPairSource& source, const std::string& scenario,
                   iStepObserver& observers)
{
    observers.begin(scenario, discipline.firstCalls());
    while (const auto pair = source.next())
        show(discipline.take(*pair), observers);
    observers.end("");
}

void show(const tStep& step, iStepObserver& observers)
{
    observers.see(step);
    if (step.failure) std::rethrow_exception(step.failure);
}

} // namespace dravikHost
