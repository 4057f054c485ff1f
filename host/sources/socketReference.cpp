#include "sources/iReference.h"

#include "text/files.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <cerrno>
#include <cmath>
#include <cstring>
#include <poll.h>
#include <string>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <system_error>

namespace dravikHost {

namespace {

// Samples as datagrams, in the form that refclock producers write into the socket of a time server:
// when it was, by the machine's clock, and by how much the true time was later.
class tSocketReference : public iReference
{
public:
    // Makes the socket, which ends with the object. One that nobody listens to any more is
    // replaced. Throws std::runtime_error.
    explicit tSocketReference(const std::string& path);
    tSocketReference(const tSocketReference&) = delete;
    tSocketReference& operator=(const tSocketReference&) = delete;
    ~tSocketReference() override;

    std::optional<tReferenceSample> next(int64_t atMostNs) override;
    int64_t unusable() const override { return unusableCount; }

private:
    std::string name;
    tDescriptor socket;
    int64_t unusableCount = 0;
};

// The members after the time, which has 32 or 64 bits for seconds and as many for microseconds.
struct tRest {
    double offset; // true minus machine's time, s
    int32_t pulse; // not 0: only the fraction of a second of the offset is known
    int32_t leap;
    int32_t unused;
    int32_t magic;
};
constexpr size_t kNarrowSize = 2 * sizeof(int32_t) + sizeof(tRest);
constexpr size_t kWideSize = 2 * sizeof(int64_t) + sizeof(tRest);
static_assert(kNarrowSize == 32 && kWideSize == 40);

template <typename Part> Part partAt(const unsigned char* bytes)
{
    Part part;
    std::memcpy(&part, bytes, sizeof part);
    return part;
}

std::optional<tReferenceSample> decode(const unsigned char* datagram, size_t size)
{
    constexpr int32_t kMagic = 0x534f434b;
    constexpr int32_t kNotSynchronised = 3;
    constexpr uint64_t kLastSecond = 18'000'000'000; // of what 64 bits of nanoseconds can tell
    constexpr double kLargestOffset = 9e9;
    if (size != kNarrowSize && size != kWideSize) return std::nullopt;
    const bool wide = size == kWideSize;
    const uint64_t seconds = wide ? partAt<uint64_t>(datagram) : partAt<uint32_t>(datagram);
    const uint64_t microseconds =
        wide ? partAt<uint64_t>(datagram + 8) : partAt<uint32_t>(datagram + 4);
    const auto rest = partAt<tRest>(datagram + size - sizeof(tRest));
    const bool plausible = seconds <= kLastSecond && microseconds < 1'000'000 &&
                           std::fabs(rest.offset) <= kLargestOffset;
    if (!plausible || rest.magic != kMagic || rest.leap == kNotSynchronised) return std::nullopt;
    const uint64_t systemNs = seconds * kSecondNs + microseconds * 1000;
    const auto offsetNs = static_cast<uint64_t>(std::llround(nsOf(rest.offset)));
    return tReferenceSample{systemNs, systemNs + offsetNs, rest.pulse != 0};
}

[[noreturn]] void fail(int failure, const std::string& path)
{
    throw std::system_error(failure, std::generic_category(), "cannot make the socket " + path);
}

sockaddr_un addressOf(const std::string& path)
{
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    if (path.size() >= sizeof address.sun_path) fail(ENAMETOOLONG, path);
    std::memcpy(address.sun_path, path.c_str(), path.size() + 1);
    return address;
}

int openSocket() { return socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0); }

// Whether a name that is taken is only the socket of a program that did not end well.
bool isAbandoned(const sockaddr_un& address)
{
    struct stat there {
    };
    if (lstat(address.sun_path, &there) != 0 || !S_ISSOCK(there.st_mode)) return false;
    const tDescriptor probe(openSocket());
    const auto* const general = reinterpret_cast<const sockaddr*>(&address);
    return connect(probe.get(), general, sizeof address) != 0 && errno == ECONNREFUSED;
}

tSocketReference::tSocketReference(const std::string& path) : name(path), socket(openSocket())
{
    if (socket.get() < 0) fail(errno, path);
    const sockaddr_un address = addressOf(path);
    const auto* const general = reinterpret_cast<const sockaddr*>(&address);
    if (bind(socket.get(), general, sizeof address) == 0) return;
    const int failure = errno;
    if (failure != EADDRINUSE || !isAbandoned(address)) fail(failure, path);
    (void)unlink(path.c_str());
    if (bind(socket.get(), general, sizeof address) != 0) fail(errno, path);
}

tSocketReference::~tSocketReference() { (void)unlink(name.c_str()); }

std::optional<tReferenceSample> tSocketReference::next(int64_t atMostNs)
{
    pollfd waiting{socket.get(), POLLIN, 0};
    if (poll(&waiting, 1, static_cast<int>(atMostNs / 1'000'000)) <= 0) return std::nullopt;
    unsigned char datagram[kWideSize + 1]; // a longer one shows
    const ssize_t size = recv(socket.get(), datagram, sizeof datagram, 0);
    if (size < 0) return std::nullopt;
    const auto sample = decode(datagram, static_cast<size_t>(size));
    if (!sample) ++unusableCount;
    return sample;
}

} // namespace

std::unique_ptr<iReference> socketReference(const std::string& path)
{
    return std::make_unique<tSocketReference>(path);
}

} // namespace dravikHost
