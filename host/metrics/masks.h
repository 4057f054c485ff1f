#pragma once

#include "metrics/tMeasured.h"

#include <string>
#include <vector>

// One limit of a mask, and what was found.
struct tMaskLine {
    std::string limit; // in words
    std::string found; // in words, or why it was not checked
    enum tVerdict { kHeld, kBroken, kNotChecked } verdict;
};

// The masks that there are: g8273.2-a to -d, the noise that a boundary or slave clock of that class
// of ITU-T G.8273.2 may make, and 802.1as, that of a time-aware system of IEEE 802.1AS.
const std::vector<std::string>& maskNames();

// Compares the phase error with one of them.
std::vector<tMaskLine> checkMask(const std::string& name, const tMeasured& measured);
