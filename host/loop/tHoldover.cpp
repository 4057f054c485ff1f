#include "loop/tHoldover.h"

#include <cmath>

bool tHoldover::silent(int64_t elapsedNs)
{
    if (since || elapsedNs - latestNs < patienceNs) return false;
    since = latestNs;
    return true;
}

void tHoldover::pair(const tPair& pair, bool locked, double orderedPpb)
{
    latestNs = pair.elapsedNs;
    since.reset();
    if (!locked) {
        window = previous = {};
        return;
    }
    window.add(pair, orderedPpb);
    if (window.count() < kWindow) return;
    previous = window;
    window = {};
}

std::optional<double> tHoldover::errorNs(int64_t elapsedNs) const
{
    const tRunningFigures& known = previous.count() > 0 ? previous : window;
    if (known.count() < kLeast) return std::nullopt;
    const double grownNs = known.deviationPpb() * static_cast<double>(lengthNs(elapsedNs)) * 1e-9;
    return std::hypot(known.rmsNs(), grownNs);
}
