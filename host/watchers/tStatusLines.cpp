#include "watchers/tStatusLines.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>

namespace dravikHost {

namespace {

std::string headText(int64_t elapsedNs)
{
    return fmt::format("dravik-host[{}]:", secondsText(elapsedNs, 3));
}

int stateOf(const tStep& step)
{
    if (step.locked) return 2;
    return step.stepNs != 0 ? 1 : 0;
}

// Times in ns, as in the rest of the line.
std::string beliefText(const std::optional<tBelief>& belief)
{
    if (!belief) return "";
    return fmt::format(" noise {:.3g} wander {:.3g} gain {:.3g} expected {:.3g}", belief->noiseNs,
                       belief->wanderPpb, belief->gain, belief->errorNs);
}

} // namespace

void tStatusLines::see(const tStep& step)
{
    if (!intervalNs || step.failure) return;
    if (*intervalNs == 0) {
        printPair(step);
    } else {
        printStretch(step);
    }
}

void tStatusLines::printPair(const tStep& step)
{
    console.print(fmt::format("{} offset {:>10} s{} freq {:>+7.0f}{}{}\n",
                              headText(step.pair.elapsedNs), step.pair.errorNs(), stateOf(step),
                              0 - step.inForcePpb, beliefText(step.belief),
                              newlyLeftOut(step.leftOut)));
}

void tStatusLines::printStretch(const tStep& step)
{
    const int64_t elapsedNs = step.pair.elapsedNs;
    figures.add(step.pair, step.inForcePpb);
    if (!lineNs) lineNs = elapsedNs;
    if (elapsedNs - *lineNs < *intervalNs) return;
    console.print(fmt::format("{} rms {:>4.0f} max {:>4.0f} freq {:>+7.0f} +/- {:>3.0f}{}{}\n",
                              headText(elapsedNs), figures.rmsNs(), figures.peakNs(),
                              0 - figures.meanPpb(), figures.deviationPpb(),
                              beliefText(step.belief), newlyLeftOut(step.leftOut)));
    lineNs = elapsedNs;
    figures = {};
}

// Samples that became no pair since the last line.
std::string tStatusLines::newlyLeftOut(const tLeftOut& leftOut)
{
    const int64_t count = leftOut.all() - leftOutBefore;
    leftOutBefore = leftOut.all();
    return count == 0 ? "" : fmt::format(" left out {}", count);
}

// At most once a second.
void tStatusLines::see(const tSilence& silence)
{
    if (!intervalNs || !silence.holdoverNs) return;
    if (lineNs && silence.elapsedNs - *lineNs < std::max(*intervalNs, kSecondNs)) return;
    lineNs = silence.elapsedNs;
    figures = {};
    console.print(
        fmt::format("{} holdover for {}, error {}\n", headText(silence.elapsedNs),
                    durationText(*silence.holdoverNs),
                    silence.errorNs ? "about " + durationText(*silence.errorNs) : "unknown"));
}

} // namespace dravikHost
