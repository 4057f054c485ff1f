#pragma once

#include <cstdint>
#include <ctime>

// Nanoseconds of one of the machine's clocks; throws std::system_error.
uint64_t systemTimeNs(clockid_t clock);
