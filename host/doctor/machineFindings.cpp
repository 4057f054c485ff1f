#include "clocks/tKernelClock.h"
#include "doctor/findings.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <cerrno>
#include <fstream>
#include <linux/capability.h>
#include <system_error>

namespace dravikHost {

namespace {

std::string stateText(const timex& state)
{
    const char* const synchronised = (state.status & STA_UNSYNC) != 0
                                         ? "nobody says that it is synchronised"
                                         : "said to be synchronised";
    const char* const loop = (state.status & STA_PLL) != 0 ? ", by the kernel's own loop" : "";
    return fmt::format("{}{}; steered by {}, up to {}", synchronised, loop,
                       offsetText(ppbOfKernelFrequency(state.freq)),
                       offsetText(ppbOfKernelFrequency(state.tolerance)));
}

// Of the effective ones, which the kernel writes as one hexadecimal number.
bool hasCapability(unsigned number)
{
    std::ifstream status("/proc/self/status");
    std::string word;
    while (status >> word) {
        if (word != "CapEff:") continue;
        unsigned long long effective = 0;
        status >> std::hex >> effective;
        return (effective >> number & 1U) != 0;
    }
    return false;
}

} // namespace

tFindings kernelClockFindings()
{
    constexpr const char* kTopic = "CLOCK_REALTIME";
    timex state{};
    if (clock_adjtime(CLOCK_REALTIME, &state) < 0)
        return {{tFinding::kFault, kTopic, std::generic_category().message(errno)}};
    const bool hasTai = state.tai != 0;
    return {{tFinding::kGood, kTopic, stateText(state)},
            {hasTai ? tFinding::kGood : tFinding::kLook, "TAI offset",
             hasTai ? fmt::format("{} s", state.tai)
                    : "0 s: nobody has set it, so that CLOCK_TAI shows UTC"}};
}

tFindings permissionFindings()
{
    const bool allowed = hasCapability(CAP_SYS_TIME);
    return {{allowed ? tFinding::kGood : tFinding::kLook, "permission",
             allowed ? "CAP_SYS_TIME is there: CLOCK_REALTIME can be steered"
                     : "no CAP_SYS_TIME: CLOCK_REALTIME cannot be steered"}};
}

} // namespace dravikHost
