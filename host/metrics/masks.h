#pragma once

#include "metrics/stability.h"
#include "metrics/tMeasured.h"

#include <optional>
#include <string>
#include <vector>

namespace dravikHost {

// One limit of a mask, and what was found.
struct tMaskLine {
    std::string limit; // in words
    std::string found; // in words, or why it was not checked
    enum tVerdict { kHeld, kBroken, kNotChecked } verdict;
};

// The masks that there are: g8273.2-a to -d, the noise that a boundary or slave clock of that class
// of ITU-T G.8273.2 may make, and 802.1as, that of a time-aware system of IEEE 802.1AS.
const std::vector<std::string>& maskNames();

// A limit of a mask that depends on tau, or is one for all of them.
struct tMaskCurve {
    const char* title;
    std::optional<double> tStability::*figure;
    bool lowPassed; // it holds for the error behind a filter of 0.1 Hz
    double fromTau; // s
    double toTau;
    double fromNs; // a straight line, where both axes are logarithmic
    double toNs;
};

// None if the mask has no such limit.
std::vector<tMaskCurve> maskCurves(const std::string& name);

// The error behind the filter of the masks. Throws std::runtime_error if its points are too far
// apart for it.
tSeries behindMaskFilter(const tSeries& series);

// Compares the phase error with one of them.
std::vector<tMaskLine> checkMask(const std::string& name, const tMeasured& measured);

} // namespace dravikHost
