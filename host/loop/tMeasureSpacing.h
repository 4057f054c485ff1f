#pragma once

#include "loop/tLockObserver.h"

#include <cstdint>
#include <optional>

// The plug-in measures the frequency over the first two pairs that it gets, however near they are,
// and the noise of both goes into it: 10 us over 1 s are 14 ppm. A host that holds pairs back in
// between lengthens the measurement.
class tMeasureSpacing
{
public:
    explicit tMeasureSpacing(int64_t minimumNs) : spacingNs(minimumNs) {}

    bool holdsBack(int64_t elapsedNs) const;
    void given(int64_t elapsedNs, tLockEvent event, bool measuring);
    void restart() { openedNs.reset(); }

private:
    int64_t spacingNs;
    std::optional<int64_t> openedNs; // when the measurement's first pair was given
};
