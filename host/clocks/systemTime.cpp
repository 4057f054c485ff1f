#include "clocks/systemTime.h"

#include <cerrno>
#include <system_error>

uint64_t systemTimeNs(clockid_t clock)
{
    timespec time{};
    if (clock_gettime(clock, &time) != 0)
        throw std::system_error(errno, std::generic_category(), "cannot read a system clock");
    return static_cast<uint64_t>(time.tv_sec) * 1'000'000'000 + static_cast<uint64_t>(time.tv_nsec);
}
