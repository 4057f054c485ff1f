#include "loop/discipline.h"

#include "loop/tLockObserver.h"
#include "loop/tReport.h"
#include "loop/tSummary.h"
#include "loop/tTrace.h"
#include "servo/tServoHost.h"

namespace {

// Hands over one pair. What the clock was asked is noted also if the plug-in then failed.
void adjust(tServoHost& host, const tPair& pair, tTrace& trace)
{
    trace.addPair(pair);
    try {
        host.adjustTime(pair.referenceNs, pair.clockNs);
    } catch (...) {
        trace.addCalls(pair.elapsedNs, host.calls());
        trace.flush();
        throw;
    }
    trace.addCalls(pair.elapsedNs, host.calls());
}

} // namespace

void discipline(const tServoLibrary& library, iClock& clock, iPairSource& source,
                const std::string& scenario, const tCommonOptions& options)
{
    tTrace trace(options.csv);
    tReport report(options.csv == "-");
    tSummary summary;
    tServoHost host(library, clock);
    tLockObserver observer(clock.minOffsetPpb(), clock.maxOffsetPpb());

    trace.addCalls(0, host.calls());
    summary.addCalls(host.calls());
    tune(host, options.tuning);
    report.print(scenario + "\n");
    while (const auto pair = source.next()) {
        adjust(host, *pair, trace);
        const tLockEvent event = observer.observe(host.calls());
        summary.addCalls(host.calls());
        summary.addPair(*pair, event, observer.locked());
        report.event(*pair, event, host.calls());
        report.progress(*pair, observer.locked());
    }
    report.print(summary.text());
    trace.flush();
}
