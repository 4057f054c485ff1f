#pragma once

#include "clocks/tRecordedClock.h"
#include "sources/iPairSource.h"
#include "traces/tRecording.h"

// The pairs of a recording as they are.
class tRecordedSource : public iPairSource
{
public:
    // Both are borrowed.
    tRecordedSource(const tRecording& recorded, tRecordedClock& recordedClock)
        : recording(recorded), clock(recordedClock)
    {}

    std::optional<tPair> next() override;

private:
    const tRecording& recording;
    tRecordedClock& clock;
    size_t index = 0;
};
