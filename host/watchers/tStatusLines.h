#pragma once

#include "loop/tRunningFigures.h"
#include "loop/tStep.h"
#include "watchers/tConsole.h"

#include <optional>

namespace dravikHost {

// Status lines in the manner of the field's tools, for each pair or for all pairs of a stretch:
//
//     dravik-host[12.345]: offset        -23 s2 freq  +12345
//     dravik-host[60.000]: rms   23 max   45 freq  +12345 +/-   12
//     dravik-host[90.000]: holdover for 20 s, error about 34 ns
//
// followed, of a self-tuned servo, by what it believes: " noise 50 wander 1 gain 0.15 expected 23",
// the noise in ns, the wander in ppb per root second, the share of a surprise that is taken for the
// clock's, and the deviation of its error in ns; and by " left out 3" if so many samples since the
// last line became no pair. The offset is clock minus reference, in ns. The state is s0 before the
// lock, s1 if the clock was stepped, s2 when locked. Freq is by how many ppb the clock was found to
// be fast: minus the offset in force.
class tStatusLines : public iStepObserver
{
public:
    // A line at most each time; 0: for each pair; nothing: never. The console is borrowed.
    tStatusLines(std::optional<int64_t> intervalNs, tConsole& console)
        : intervalNs(intervalNs), console(console)
    {}

    void see(const tStep& step) override;
    void see(const tSilence& silence) override;

private:
    void printPair(const tStep& step);
    void printStretch(const tStep& step);
    std::string newlyLeftOut(const tLeftOut& leftOut);

    std::optional<int64_t> intervalNs;
    tConsole& console;
    tRunningFigures figures; // since the last line
    std::optional<int64_t> lineNs;
    int64_t leftOutBefore = 0; // samples, at the last line
};

} // namespace dravikHost
