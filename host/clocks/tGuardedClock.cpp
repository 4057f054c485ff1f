#include "clocks/tGuardedClock.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <stdexcept>

void tGuardedClock::step(int64_t deltaNs)
{
    const auto text = [](int64_t ns) { return signedDurationText(static_cast<double>(ns)); };
    if (guards.maxStepNs && (deltaNs > *guards.maxStepNs || deltaNs < -*guards.maxStepNs)) {
        throw std::runtime_error(fmt::format("a step by {} is larger than --max-step allows, {}",
                                             text(deltaNs), text(*guards.maxStepNs)));
    }
    if (guards.noStepAfterLock && wasLocked)
        throw std::runtime_error(fmt::format("a step by {} after the first lock", text(deltaNs)));
    if (dryRun) return;
    clock.step(deltaNs);
    sumNs += deltaNs;
}

void tGuardedClock::setOffsetPpb(int32_t offsetPpb)
{
    if (!dryRun) clock.setOffsetPpb(offsetPpb);
}
