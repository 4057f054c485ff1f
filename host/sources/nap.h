#pragma once

#include <cstdint>
#include <ctime>

// Sleeps for so long, or until a signal. Less than a second.
inline void nap(int64_t ns)
{
    const timespec time{0, static_cast<long>(ns)};
    (void)nanosleep(&time, nullptr);
}
