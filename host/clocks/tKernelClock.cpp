#include "clocks/tKernelClock.h"

#include "clocks/systemTime.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <cerrno>
#include <cmath>
#include <stdexcept>
#include <system_error>
#include <utility>

namespace dravikHost {

namespace {

constexpr double kKernelUnitsPerPpb = 65.536;

// A time_t may have 32 bits.
time_t secondsOf(int64_t whole)
{
    const auto seconds = static_cast<time_t>(whole);
    if (seconds != whole)
        throw std::out_of_range(fmt::format("a step of {} s is beyond this machine's time", whole));
    return seconds;
}

} // namespace

long kernelFrequency(double offsetPpb) { return std::lround(offsetPpb * kKernelUnitsPerPpb); }

double ppbOfKernelFrequency(long frequency)
{
    return static_cast<double>(frequency) / kKernelUnitsPerPpb;
}

tKernelClock::tKernelClock(clockid_t id, std::string name, int32_t limitPpb,
                           std::function<tCrossReading()> reader)
    : id(id), name(std::move(name)), limitPpb(limitPpb), reader(std::move(reader))
{}

void tKernelClock::requireSettable()
{
    timex request{};
    request.freq = adjust({}, "read").freq;
    request.modes = ADJ_FREQUENCY;
    adjust(request, "set the frequency of");
}

uint64_t tKernelClock::timeNs() { return systemTimeNs(id); }

// The kernel wants seconds of either sign and nanoseconds that are not negative.
void tKernelClock::step(int64_t deltaNs)
{
    const int64_t nanoseconds = ((deltaNs % kSecondNs) + kSecondNs) % kSecondNs;
    timex request{};
    request.modes = ADJ_SETOFFSET | ADJ_NANO;
    request.time.tv_sec = secondsOf((deltaNs - nanoseconds) / kSecondNs);
    request.time.tv_usec = static_cast<suseconds_t>(nanoseconds);
    adjust(request, "step");
}

double tKernelClock::offsetPpb() { return ppbOfKernelFrequency(adjust({}, "read").freq); }

// Beyond its limits one clock refuses and another one takes the limit without a word.
void tKernelClock::setOffsetPpb(double offsetPpb)
{
    timex request{};
    request.modes = ADJ_FREQUENCY;
    request.freq = kernelFrequency(offsetPpb);
    adjust(request, "set the frequency of");
    const long inForce = adjust({}, "read").freq;
    if (inForce == request.freq) return;
    throw std::out_of_range(fmt::format("{} took an offset of {:.10g} ppb for {:.10g} ppb", name,
                                        ppbOfKernelFrequency(inForce), offsetPpb));
}

timex tKernelClock::adjust(timex request, const char* deed)
{
    if (clock_adjtime(id, &request) >= 0) return request;
    const int failure = errno;
    throw std::system_error(
        failure, std::generic_category(),
        fmt::format("cannot {} {}{}", deed, name,
                    failure == EPERM && id == CLOCK_REALTIME ? ", which takes CAP_SYS_TIME" : ""));
}

} // namespace dravikHost
