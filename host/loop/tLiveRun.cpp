#include "loop/tLiveRun.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <stdexcept>

tLiveRun::tLiveRun(const tServoLibrary& plugIn, iClock& guarded, tSignals& watched,
                   const tLiveRunOptions& given)
    : signals(watched), options(given), clock(guarded, options.guards, options.discipline.dryRun),
      discipline(plugIn, clock, options.discipline),
      heldPpb(options.discipline.dryRun ? guarded.offsetPpb() : 0), sanity(options.sanityLimitPpb),
      holdover(options.silenceNs), monitor(options.monitor)
{}

void tLiveRun::run(const std::string& scenario, iLiveSource& source)
{
    discipline.start(scenario);
    while (const auto moment = source.next()) {
        if (signals.takeReload()) reload(moment->elapsedNs);
        if (moment->pair) {
            take(*moment->pair);
        } else {
            silence(moment->elapsedNs);
        }
    }
    const std::string remarks = source.remarks();
    if (!remarks.empty()) discipline.reporter().print(remarks + "\n");
    discipline.finish();
}

void tLiveRun::take(const tPair& pair)
{
    endHoldover(pair);
    const std::string wrong =
        sanity.look(pair.elapsedNs, pair.referenceNs, pair.clockNs, clock.steppedNs());
    if (!wrong.empty()) {
        discipline.note(pair.elapsedNs, wrong + ": measuring anew");
        discipline.clearHistory();
    }
    const int64_t steppedNs = clock.steppedNs();
    discipline.take(pair);
    clock.setLocked(discipline.locked());
    holdover.pair(pair, discipline.locked(), inForcePpb());
    tRunMonitor::tState now = state(pair.elapsedNs);
    now.stepped = clock.steppedNs() != steppedNs;
    monitor.pair(pair, now, discipline.reporter());
}

// What was measured before a long silence says nothing of the clock after it.
void tLiveRun::endHoldover(const tPair& pair)
{
    if (!holdover.lasting()) return;
    const int64_t lengthNs = holdover.lengthNs(pair.elapsedNs);
    const bool tooLong = lengthNs >= options.longHoldoverNs;
    discipline.note(pair.elapsedNs, fmt::format("reference is back after {}{}",
                                                durationText(static_cast<double>(lengthNs)),
                                                tooLong ? ": measuring anew" : ""));
    if (tooLong) discipline.clearHistory();
}

void tLiveRun::silence(int64_t elapsedNs)
{
    if (holdover.silent(elapsedNs)) {
        discipline.note(elapsedNs, "reference is silent: holding the frequency");
    }
    if (holdover.lasting()) {
        const auto error = holdover.errorNs(elapsedNs);
        discipline.reporter().progressText(
            fmt::format("{:>10} s  holdover for {}, error about {}", secondsText(elapsedNs, 3),
                        durationText(static_cast<double>(holdover.lengthNs(elapsedNs))),
                        error ? durationText(*error) : "unknown"));
    }
    monitor.silence(elapsedNs, state(elapsedNs), discipline.reporter());
}

void tLiveRun::reload(int64_t elapsedNs)
{
    try {
        discipline.retune();
        discipline.note(elapsedNs, "documents read again");
    } catch (const std::runtime_error& failure) {
        discipline.note(elapsedNs, fmt::format("documents stay as they are: {}", failure.what()));
    }
}

double tLiveRun::inForcePpb() const
{
    return options.discipline.dryRun ? heldPpb : discipline.figures().orderedPpb();
}

tRunMonitor::tState tLiveRun::state(int64_t elapsedNs) const
{
    const tSummary& figures = discipline.figures();
    tRunMonitor::tState state;
    state.locked = discipline.locked();
    state.inForcePpb = inForcePpb();
    state.pairs = figures.pairsTaken();
    state.locksLost = figures.lostLocks();
    state.steps = figures.steps();
    if (!holdover.lasting()) return state;
    state.holdoverNs = holdover.lengthNs(elapsedNs);
    state.holdoverErrorNs = holdover.errorNs(elapsedNs);
    return state;
}
