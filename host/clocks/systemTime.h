#pragma once

#include "clocks/tCrossReading.h"

#include <ctime>

// Nanoseconds of one of the machine's clocks; throws std::system_error.
uint64_t systemTimeNs(clockid_t clock);

// CLOCK_REALTIME beside itself.
tCrossReading readSystemItself();

// The closest of several readings of another of the machine's clocks: that one is read before and
// after CLOCK_REALTIME, which belongs to the middle.
tCrossReading crossReadSystem(clockid_t clock);
