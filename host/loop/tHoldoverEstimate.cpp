#include "loop/tHoldoverEstimate.h"

#include "text/quantity.h"

#include <cmath>

namespace dravikHost {

void tHoldoverEstimate::add(const tStep& step)
{
    if (!step.locked) {
        window = previous = {};
        return;
    }
    window.add(step.pair, step.inForcePpb);
    if (window.count() < kWindow) return;
    previous = window;
    window = {};
}

std::optional<double> tHoldoverEstimate::errorNs(int64_t lengthNs) const
{
    const tRunningFigures& known = previous.count() > 0 ? previous : window;
    if (known.count() < kLeast) return std::nullopt;
    return std::hypot(known.rmsNs(), known.deviationPpb() * secondsOf(lengthNs));
}

} // namespace dravikHost
