#pragma once

#include "clocks/iClock.h"

#include <cstdint>
#include <ctime>

namespace dravikHost {

// Nanoseconds of one of the machine's clocks; throws std::system_error.
uint64_t systemTimeNs(clockid_t clock);

// CLOCK_MONOTONIC_RAW, which nobody steers or steps.
inline uint64_t rawTimeNs() { return systemTimeNs(CLOCK_MONOTONIC_RAW); }

// CLOCK_REALTIME beside itself.
tCrossReading readSystemItself();

// The closest of several readings of another of the machine's clocks: that one is read before and
// after CLOCK_REALTIME, which belongs to the middle.
tCrossReading crossReadSystem(clockid_t clock);

// Sleeps for so long, or until a signal. Less than a second.
void nap(int64_t ns);

} // namespace dravikHost
