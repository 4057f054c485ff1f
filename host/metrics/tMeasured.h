#pragma once

#include "metrics/stability.h"
#include "traces/tRecording.h"

#include <optional>
#include <string>

namespace dravikHost {

// What of a trace is looked at.
struct tSelection {
    bool measured = false;         // the measured error also where the true one is known
    std::optional<int64_t> fromNs; // else from the first lock on, if the trace tells of locks
    std::optional<int64_t> toNs;
};

// The figures of a phase error that need no even spacing, and the series that the others need.
struct tMeasured {
    std::string what; // in words
    double fromSeconds = 0;
    double toSeconds = 0;
    std::vector<double> errors;       // s, all
    std::vector<double> times;        // s, of each
    tSeries series;                   // the longest stretch without a gap
    std::optional<double> timeToLock; // s; if the trace tells of locks
    std::optional<int64_t> locksLost;
    std::vector<double> greatest; // s, of summaries: then errors are RMS values, without a mean

    // Takes out the straight line from the first point to the last, of errors and series each.
    // Throws std::runtime_error if there is but one.
    void removeSlope();

    std::optional<double> mean() const;
    double rms() const;
    double peak() const;
    std::optional<double> peakToPeak() const;
};

// Throws std::runtime_error if nothing is selected.
tMeasured measure(const tRecording& recording, const tSelection& selection);

} // namespace dravikHost
