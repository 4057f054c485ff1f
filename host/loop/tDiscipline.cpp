#include "loop/tDiscipline.h"

#include "clocks/tSteeredClock.h"

namespace {

// The servo's calls while it was made are noted before it is tuned.
tServoHost& tuned(tServoHost& host, tTrace& trace, tSummary& summary, const tTuning& tuning)
{
    trace.addCalls(0, host.calls());
    summary.addCalls(host.calls());
    tune(host, tuning);
    return host;
}

} // namespace

tDiscipline::tDiscipline(const tServoLibrary& plugIn, iClock& clock,
                         const tDisciplineOptions& given)
    : library(plugIn), options(given), trace(options.csv, options.dryRun),
      report(options.csv == "-"), host(library, clock),
      observer(clock.minOffsetPpb(), clock.maxOffsetPpb()), spacing(options.measureOverNs),
      later(tuned(host, trace, summary, options.tuning), options.later)
{}

void tDiscipline::start(const std::string& scenario) { report.print(scenario + "\n"); }

void tDiscipline::take(const tPair& pair)
{
    trace.addPair(pair);
    if (spacing.holdsBack(pair.elapsedNs)) {
        summary.addHeldBack(pair);
        return;
    }
    adjust(pair);
    const tLockEvent event = observer.observe(host.calls());
    spacing.given(pair.elapsedNs, event, observer.measuring());
    summary.addCalls(host.calls());
    summary.addPair(pair, event, observer.locked());
    report.event(pair, event, host.calls());
    report.note(pair.elapsedNs, later.observe(host, pair.elapsedNs, observer.locked()));
    report.progress(pair, observer.locked());
}

// What the clock was asked is noted also if the plug-in then failed.
void tDiscipline::adjust(const tPair& pair)
{
    try {
        host.adjustTime(pair.referenceNs, pair.clockNs);
    } catch (...) {
        trace.addCalls(pair.elapsedNs, host.calls());
        trace.flush();
        throw;
    }
    trace.addCalls(pair.elapsedNs, host.calls());
}

void tDiscipline::clearHistory()
{
    host.clearHistory();
    if (observer.locked()) summary.addLostLock();
    observer.restart();
    spacing.restart();
}

void tDiscipline::retune()
{
    tSteeredClock still(0, 0, 0);
    tServoHost trial(library, still);
    tune(trial, options.tuning);
    tLaterDocuments anew(trial, options.later);
    host.writeConfig(trial.readConfig()); // all keys: what is no longer in a document goes back
    anew.takeOver(later);
    later = anew;
}

void tDiscipline::finish()
{
    report.print(summary.text());
    trace.flush();
}

void tDiscipline::run(const std::string& scenario, iPairSource& source)
{
    start(scenario);
    while (const auto pair = source.next())
        take(*pair);
    finish();
}
