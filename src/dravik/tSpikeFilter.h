#pragma once

#include "dravik/iServoConfig.h"

#include <vector>

namespace zvckmDravik {

// Limits how fast the phase error may change from one pair to the next, to a multiple of how fast
// it changed lately. A single outlier thus moves the control law only as far as the recent past
// allows; no sample is dropped or delayed. Offsets in seconds, rates in seconds per second.
class tSpikeFilter
{
public:
    explicit tSpikeFilter(iServoConfig& config);

    // Forgets the past; the limit rises to its ceiling. Storage is kept.
    void reset();

    // One pair: the phase error, and the reference time since the previous pair (0.0 for the first
    // in a lock). Returns the phase error to act on.
    double filter(double offset, double elapsed);

private:
    void remember(double magnitude);
    double nextThreshold() const;

    iServoConfig& config;
    std::vector<double> history; // magnitudes of the last rates, oldest first
    double historySum;           // follows history entry by entry and is never summed anew
    double lastOffset;           // what was returned last
    double threshold;            // the present limit on the magnitude of a rate
};

} // namespace zvckmDravik
