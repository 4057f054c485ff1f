#pragma once

#include "servo/tLockObserver.h"

#include <cstdint>
#include <optional>

namespace dravikHost {

// The plug-in measures the frequency over the first two pairs that it gets, however near they are,
// and the noise of both goes into it: 10 us over 1 s are 14 ppm. A host that holds pairs back in
// between lengthens the measurement.
class tMeasureSpacing
{
public:
    explicit tMeasureSpacing(int64_t spacingNs) : spacingNs(spacingNs) {}

    bool holdsBack(int64_t elapsedNs) const
    {
        return openedNs && elapsedNs - *openedNs < spacingNs;
    }

    // A pair that ended something else, a lock or an attempt, is spent: the next one opens.
    void given(int64_t elapsedNs, tLockEvent event, bool measuring)
    {
        if (measuring && event == kNothingNew && !openedNs) {
            openedNs = elapsedNs;
        } else if (!measuring || event != kNothingNew) {
            openedNs.reset();
        }
    }

    void restart() { openedNs.reset(); }

private:
    int64_t spacingNs;               // at least
    std::optional<int64_t> openedNs; // when the measurement's first pair was given
};

} // namespace dravikHost
