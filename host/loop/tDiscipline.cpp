#include "loop/tDiscipline.h"

#include "clocks/tSteeredClock.h"

#include <fmt/format.h>

#include <algorithm>
#include <stdexcept>
#include <system_error>
#include <utility>

namespace dravikHost {

tDiscipline::tDiscipline(const tServoLibrary& library, iClock& clock,
                         const tDisciplineOptions& options)
    : library(library), options(options), tuned(readDocuments(library, options)), clock(clock),
      servo(library, clock,
            tFineServo::factorFor(options.factor, tFineServo::limitOf(clock),
                                  tuned.documents.widestThreshold()),
            tuned.documents.first()),
      callsThatMadeIt(servo.calls()), spacing(options.measureOverNs), inForcePpb(clock.offsetPpb())
{
    if (options.selfTune) selfTuning.emplace(servo, clock, options.hops);
    if (servo.factor() == options.factor) return;
    tuned.notes.push_back(fmt::format("resolution {} ppb: limits and thresholds allow no finer one",
                                      1.0 / servo.factor()));
}

tDiscipline::tTuned tDiscipline::readDocuments(const tServoLibrary& library,
                                               const tDisciplineOptions& options)
{
    tStillClock still;
    tServoHost trial(library, still);
    tNotes notes = tune(trial, options.tuning);
    tLaterDocuments later(trial, options.later);
    notes.insert(notes.end(), later.notes().begin(), later.notes().end());
    return {std::move(notes), std::move(later)};
}

tStep tDiscipline::take(const tPair& pair)
{
    tStep step;
    step.pair = pair;
    step.dryRun = options.dryRun;
    try {
        step.heldBack = !isToBeHanded(pair, step);
        if (!step.heldBack) hand(pair, step);
    } catch (...) {
        step.failure = std::current_exception();
    }
    step.locked = servo.locked();
    step.inForcePpb = inForcePpb;
    step.steps = steps;
    step.locksLost = locksLost;
    meanOrders.add(step);
    return step;
}

bool tDiscipline::isToBeHanded(const tPair& pair, tStep& step)
{
    if (!selfTuning) return !spacing.holdsBack(pair.elapsedNs);
    const bool handed = selfTuning->prepare(pair.elapsedNs, pair.errorNs());
    step.calls = selfTuning->orders();
    step.belief = selfTuning->belief();
    step.tuning = selfTuning->note();
    if (!handed) followOrders(step);
    return handed;
}

// What the clock was asked is part of the step also if the plug-in then failed.
void tDiscipline::hand(const tPair& pair, tStep& step)
{
    resumeLaw(step);
    std::exception_ptr failure;
    try {
        step.event = servo.adjustTime(pair.referenceNs, pair.clockNs);
    } catch (...) {
        failure = std::current_exception();
    }
    const tHostCalls& calls = servo.calls();
    step.calls.append(calls);
    followOrders(step);
    if (failure) std::rethrow_exception(failure);
    spacing.given(pair.elapsedNs, step.event, servo.measuring());
    if (step.event == kLockLost) ++locksLost;
    if (selfTuning) {
        selfTuning->follow(pair.errorNs(), step.event, calls);
        return;
    }
    const auto change = tuned.documents.observe(pair.elapsedNs, servo.locked());
    if (!change) return;
    servo.writeParameters(change->parameters);
    step.tuning = change->text;
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
    const bool wasLocked = servo.locked();
    servo.clearHistory();
    if (wasLocked) ++locksLost;
    spacing.restart();
    meanOrders.restart();
    if (selfTuning) selfTuning->restart();
}

// A clock that is silent itself is asked again later.
tSilence tDiscipline::wait(int64_t elapsedNs)
{
    tSilence silence;
    silence.elapsedNs = elapsedNs;
    if (options.dryRun) return silence;
    if (selfTuning) {
        if (selfTuning->coast(elapsedNs)) silence.calls = selfTuning->orders();
    } else if (const auto meanPpb = meanOrders.orderFor(elapsedNs)) {
        try {
            order(*meanPpb, silence.calls);
        } catch (const std::system_error&) {
            meanOrders.restart();
        }
    }
    if (!silence.calls.empty()) inForcePpb = silence.calls.back().ppb;
    return silence;
}

void tDiscipline::resumeLaw(tStep& step)
{
    const tServoParameters& law = servo.parameters();
    if (const auto ppb = meanOrders.resume(law.phaseLockGain * law.phaseLockCoefficientB))
        order(*ppb, step.calls);
}

void tDiscipline::order(double ppb, tHostCalls& calls)
{
    clock.setOffsetPpb(std::clamp<double>(ppb, clock.minOffsetPpb(), clock.maxOffsetPpb()));
    calls.push_back({kSetFrequency, 0, clock.offsetPpb()});
}

tNotes tDiscipline::retune()
{
    if (selfTuning) throw std::runtime_error("there are none, as the servo tunes itself");
    tTuned anew = readDocuments(library, options);
    servo.requireThreshold(anew.documents.widestThreshold());
    servo.writeParameters(anew.documents.first());
    anew.documents.takeOver(tuned.documents);
    tuned = std::move(anew);
    return tuned.notes;
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
        while (const auto moment = source.next()) {
            if (moment->pair) {
                show(discipline.take(*moment->pair), observers);
            } else {
                observers.see(discipline.wait(moment->elapsedNs));
            }
        }
    } catch (...) {
        failure = std::current_exception();
    }
    observers.end(source.remarks());
    if (failure) std::rethrow_exception(failure);
}

void show(const tStep& step, iStepObserver& observers)
{
    observers.see(step);
    if (step.failure) std::rethrow_exception(step.failure);
}

} // namespace dravikHost
