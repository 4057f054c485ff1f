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
    std::string found; // in words, or why it was not judged
    enum tVerdict { kHeld, kBroken, kNotJudged } verdict;
};

// The masks that there are: the noise that a clock of that class may make, g8273.2-a to -d for a
// boundary or slave clock of ITU-T G.8273.2, g8273.3-a and -b for a transparent clock of ITU-T
// G.8273.3; and 802.1as, with the TDEV of a free-running local clock of IEEE 802.1AS.
const std::vector<std::string>& maskNames();

// Its document with edition and amendments, and the clock that it binds.
std::string maskTitle(const std::string& name);

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

// Compares the phase error with one of them. A limit is broken by what breaks it; without enough
// data to hold it, it is not judged.
std::vector<tMaskLine> checkMask(const std::string& name, const tMeasured& measured);

} // namespace dravikHost
