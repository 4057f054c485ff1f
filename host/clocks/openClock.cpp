#include "clocks/openClock.h"

#include "clocks/systemTime.h"
#include "clocks/tKernelClock.h"
#include "clocks/tPtpDevice.h"
#include "clocks/tSoftClock.h"
#include "text/words.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <limits>
#include <system_error>

namespace dravikHost {

namespace {

int32_t wholePpb(long kernelFrequency)
{
    return static_cast<int32_t>(std::lround(ppbOfKernelFrequency(kernelFrequency)));
}

// What the kernel's own numbers can say: a long may have 32 bits.
int32_t withinKernel(double limitPpb)
{
    const int32_t widestPpb = sizeof(long) > 4 ? std::numeric_limits<int32_t>::max()
                                               : wholePpb(std::numeric_limits<int32_t>::max()) - 1;
    return static_cast<int32_t>(std::min<double>(limitPpb, widestPpb));
}

std::unique_ptr<iLiveClock> ready(std::unique_ptr<tKernelClock> clock, bool isToBeSet)
{
    if (isToBeSet) clock->requireSettable();
    return clock;
}

std::unique_ptr<tKernelClock> openPtp(const std::string& path, int32_t limitPpb)
{
    const auto device = std::make_shared<tPtpDevice>(path);
    const int32_t narrower = std::min(limitPpb, withinKernel(device->maxOffsetPpb()));
    return std::make_unique<tKernelClock>(device->clock(), path, narrower,
                                          [device] { return device->crossRead(); });
}

std::unique_ptr<tKernelClock> openRealtime(int32_t limitPpb)
{
    timex state{};
    if (clock_adjtime(CLOCK_REALTIME, &state) < 0)
        throw std::system_error(errno, std::generic_category(), "cannot read CLOCK_REALTIME");
    const int32_t narrower = std::min(limitPpb, wholePpb(state.tolerance));
    return std::make_unique<tKernelClock>(CLOCK_REALTIME, "CLOCK_REALTIME", narrower,
                                          readSystemItself);
}

std::unique_ptr<iLiveClock> startSoft(const tClockChoice& choice)
{
    const uint64_t startNs =
        systemTimeNs(CLOCK_REALTIME) + static_cast<uint64_t>(choice.startOffsetNs);
    return std::make_unique<tSoftClock>(startNs, choice.startFrequencyPpb, choice.limitPpb);
}

} // namespace

bool isClockName(const std::string& name)
{
    return name == "soft" || name == "realtime" || afterPrefix(name, "phc:");
}

std::unique_ptr<iLiveClock> openClock(const tClockChoice& choice)
{
    if (choice.name == "soft") return startSoft(choice);
    const auto path = afterPrefix(choice.name, "phc:");
    if (path) return ready(openPtp(*path, choice.limitPpb), choice.isToBeSet);
    return ready(openRealtime(choice.limitPpb), choice.isToBeSet);
}

} // namespace dravikHost
