#pragma once

#include "clocks/tRecordedClock.h"
#include "clocks/tSteeredClock.h"
#include "sources/iPairSource.h"
#include "traces/tRecording.h"

namespace dravikHost {

// The pairs of a recording as they are.
class tRecordedSource : public iPairSource
{
public:
    // Both are borrowed.
    tRecordedSource(const tRecording& recording, tRecordedClock& clock)
        : recording(recording), clock(clock)
    {}

    std::optional<tMoment> next() override;

private:
    const tRecording& recording;
    tRecordedClock& clock;
    size_t index = 0;
};

// The pairs that a recording would have had, had its clock been ordered something else: the
// recorded corrections are taken out of the errors, which leaves the oscillator and the noise, and
// the clock of this run adds its own.
class tFreeRunningSource : public iPairSource
{
public:
    // Both are borrowed; the clock is moved on from pair to pair and starts at the first one's
    // time. Throws std::runtime_error if the recording does not tell all corrections.
    tFreeRunningSource(const tRecording& recording, tFreeRunningClock& clock);

    std::optional<tMoment> next() override;

private:
    const tRecording& recording;
    tFreeRunningClock& clock;
    size_t index = 0;
};

} // namespace dravikHost
