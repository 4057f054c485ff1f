#include "clocks/tKernelClock.h"
#include "doctor/findings.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <cerrno>
#include <system_error>

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
