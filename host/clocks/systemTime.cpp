#include "clocks/systemTime.h"

#include "text/quantity.h"

#include <cerrno>
#include <limits>
#include <system_error>

namespace dravikHost {

uint64_t systemTimeNs(clockid_t clock)
{
    timespec time{};
    if (clock_gettime(clock, &time) != 0)
        throw std::system_error(errno, std::generic_category(), "cannot read a system clock");
    return static_cast<uint64_t>(time.tv_sec) * kSecondNs + static_cast<uint64_t>(time.tv_nsec);
}

tCrossReading readSystemItself()
{
    const uint64_t nowNs = systemTimeNs(CLOCK_REALTIME);
    return {nowNs, nowNs, 0};
}

tCrossReading crossReadSystem(clockid_t clock)
{
    constexpr int kAttempts = 9;
    tCrossReading best{0, 0, std::numeric_limits<uint64_t>::max()};
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        const uint64_t beforeNs = systemTimeNs(clock);
        const uint64_t systemNs = systemTimeNs(CLOCK_REALTIME);
        const uint64_t windowNs = systemTimeNs(clock) - beforeNs;
        if (windowNs < best.windowNs) best = {systemNs, beforeNs + windowNs / 2, windowNs};
    }
    return best;
}

void nap(int64_t ns)
{
    const timespec time{0, static_cast<long>(ns)};
    (void)nanosleep(&time, nullptr);
}

} // namespace dravikHost
