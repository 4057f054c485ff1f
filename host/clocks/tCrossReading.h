#pragma once

#include <cstdint>

// The machine's clock and another one at the same moment, as nearly as can be told.
struct tCrossReading {
    uint64_t systemNs; // CLOCK_REALTIME
    uint64_t clockNs;
    uint64_t windowNs; // within which both were read; 0: they are one clock, or read in hardware
};
