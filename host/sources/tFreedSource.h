#pragma once

#include "clocks/tFreedClock.h"
#include "sources/iPairSource.h"
#include "traces/tRecording.h"

// The pairs that a recording would have had, had its clock been ordered something else: the
// recorded corrections are taken out of the errors, which leaves the oscillator and the noise, and
// the clock of this run adds its own.
class tFreedSource : public iPairSource
{
public:
    // Both are borrowed; the clock is moved on from pair to pair and starts at the first one's
    // time. Throws std::runtime_error if the recording does not tell all corrections.
    tFreedSource(const tRecording& recorded, tFreedClock& freedClock);

    std::optional<tPair> next() override;

private:
    const tRecording& recording;
    tFreedClock& clock;
    size_t index = 0;
};
