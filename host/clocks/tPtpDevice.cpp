#include "clocks/tPtpDevice.h"

#include "text/quantity.h"

#include <cerrno>
#include <fcntl.h>
#include <limits>
#include <linux/ptp_clock.h>
#include <sys/ioctl.h>
#include <system_error>

namespace dravikHost {

namespace {

constexpr unsigned kSamples = 9;

uint64_t nsOf(const ptp_clock_time& time)
{
    return static_cast<uint64_t>(time.sec) * kSecondNs + time.nsec;
}

void keepShortest(tCrossReading& best, const ptp_clock_time& before, const ptp_clock_time& device,
                  const ptp_clock_time& after)
{
    const uint64_t windowNs = nsOf(after) - nsOf(before);
    if (windowNs < best.windowNs) best = {nsOf(before) + windowNs / 2, nsOf(device), windowNs};
}

constexpr tCrossReading kNoReading = {0, 0, std::numeric_limits<uint64_t>::max()};

// Who may only look at a clock can still read it.
int openDevice(const std::string& path)
{
    const int fd = open(path.c_str(), O_RDWR | O_CLOEXEC);
    const bool forbidden = fd < 0 && (errno == EACCES || errno == EPERM || errno == EROFS);
    return forbidden ? open(path.c_str(), O_RDONLY | O_CLOEXEC) : fd;
}

} // namespace

tPtpDevice::tPtpDevice(const std::string& path) : name(path), file(openDevice(path))
{
    if (file.get() < 0)
        throw std::system_error(errno, std::generic_category(), "cannot open " + path);
    ptp_clock_caps capabilities{};
    if (!ask(PTP_CLOCK_GETCAPS, &capabilities))
        throw std::system_error(errno, std::generic_category(), path + " is not a PTP clock");
    limitPpb = capabilities.max_adj;
}

// The kernel's own numbering of clocks that are opened as files.
clockid_t tPtpDevice::clock() const
{
    constexpr unsigned kClockOfDescriptor = 3;
    return static_cast<clockid_t>((~static_cast<unsigned>(file.get()) << 3U) | kClockOfDescriptor);
}

tCrossReading tPtpDevice::crossRead()
{
    for (;;) {
        if (const auto reading = read(latest)) return *reading;
        const bool unknown = errno == EOPNOTSUPP || errno == ENOTTY || errno == EINVAL;
        if (latest == kBasic || !unknown)
            throw std::system_error(errno, std::generic_category(), "cannot read " + name);
        latest = static_cast<tMethod>(latest + 1);
    }
}

const char* tPtpDevice::method() const
{
    constexpr const char* kNames[] = {"PTP_SYS_OFFSET_PRECISE", "PTP_SYS_OFFSET_EXTENDED",
                                      "PTP_SYS_OFFSET"};
    return kNames[latest];
}

std::optional<tCrossReading> tPtpDevice::read(tMethod which) const
{
    return which == kPrecise ? readPrecise() : which == kExtended ? readExtended() : readBasic();
}

std::optional<tCrossReading> tPtpDevice::readPrecise() const
{
    ptp_sys_offset_precise reply{};
    if (!ask(PTP_SYS_OFFSET_PRECISE, &reply)) return std::nullopt;
    return tCrossReading{nsOf(reply.sys_realtime), nsOf(reply.device), 0};
}

std::optional<tCrossReading> tPtpDevice::readExtended() const
{
    ptp_sys_offset_extended reply{};
    reply.n_samples = kSamples;
    if (!ask(PTP_SYS_OFFSET_EXTENDED, &reply)) return std::nullopt;
    tCrossReading best = kNoReading;
    for (unsigned i = 0; i < kSamples; ++i)
        keepShortest(best, reply.ts[i][0], reply.ts[i][1], reply.ts[i][2]);
    return best;
}

std::optional<tCrossReading> tPtpDevice::readBasic() const
{
    ptp_sys_offset reply{};
    reply.n_samples = kSamples;
    if (!ask(PTP_SYS_OFFSET, &reply)) return std::nullopt;
    tCrossReading best = kNoReading;
    for (size_t i = 0; i < size_t{2} * kSamples; i += 2)
        keepShortest(best, reply.ts[i], reply.ts[i + 1], reply.ts[i + 2]);
    return best;
}

bool tPtpDevice::ask(unsigned long request, void* argument) const
{
    return ioctl(file.get(), request, argument) == 0;
}

} // namespace dravikHost
