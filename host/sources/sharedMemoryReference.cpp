#include "sources/iReference.h"

#include "clocks/systemTime.h"
#include "sources/tSamplePace.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <ctime>
#include <stdexcept>
#include <sys/ipc.h>
#include <sys/shm.h>
#include <system_error>

namespace dravikHost {

namespace {

// Samples in a shared memory segment as NTP servers' drivers read it: one at a time, which the
// producer marks as valid and the consumer as taken. The producer may have a time_t of 32 or of 64
// bits, which the size of the segment tells.
class tSharedMemoryReference : public iReference
{
public:
    // Attaches the segment of that unit, or makes one for the producer to find. Throws
    // std::runtime_error.
    tSharedMemoryReference(int unit, key_t firstKey);
    tSharedMemoryReference(const tSharedMemoryReference&) = delete;
    tSharedMemoryReference& operator=(const tSharedMemoryReference&) = delete;
    ~tSharedMemoryReference() override;

    std::optional<tReferenceSample> next(int64_t atMostNs) override;
    int64_t unusable() const override { return unusableCount; }

private:
    std::optional<tReferenceSample> take();
    uint32_t* wordAt(size_t offset) const { return reinterpret_cast<uint32_t*>(segment + offset); }

    unsigned char* segment = nullptr;
    bool wide = false; // time_t of 64 bits
    int64_t unusableCount = 0;
    tSamplePace pace;
};

// The members of the segment, by their offsets in bytes. Reference is the true time of an event
// and system the machine's at the same moment; both have microseconds, and nanoseconds that older
// producers leave alone.
struct tLayout {
    size_t size;
    size_t referenceSeconds, referenceMicroseconds;
    size_t systemSeconds, systemMicroseconds;
    size_t leap, valid;
    size_t referenceNanoseconds, systemNanoseconds;
};
constexpr size_t kMode = 0;
constexpr size_t kCount = 4;
constexpr tLayout kNarrow = {80, 8, 12, 16, 20, 24, 36, 40, 44};
constexpr tLayout kWide = {96, 8, 16, 24, 32, 36, 48, 52, 56};

constexpr uint32_t kNotSynchronised = 3; // of leap

const tLayout& layoutOf(bool wide) { return wide ? kWide : kNarrow; }

// The times in a segment.
class tSegmentView
{
public:
    tSegmentView(const std::function<uint32_t(size_t)>& word, bool isWide)
        : word(word), layout(layoutOf(isWide)), wide(isWide)
    {}

    std::optional<uint64_t> referenceNs() const
    {
        return timeNs(layout.referenceSeconds, layout.referenceMicroseconds,
                      layout.referenceNanoseconds);
    }
    std::optional<uint64_t> systemNs() const
    {
        return timeNs(layout.systemSeconds, layout.systemMicroseconds, layout.systemNanoseconds);
    }

private:
    // A second of 32 bits has no sign: it lasts until 2106. One of 64 is read in halves, which the
    // count of mode 1 keeps together.
    uint64_t seconds(size_t offset) const
    {
        if (!wide) return word(offset);
        const uint32_t halves[] = {word(offset), word(offset + sizeof(uint32_t))};
        uint64_t whole = 0;
        std::memcpy(&whole, halves, sizeof whole);
        return whole;
    }

    // Nothing if it is no time that 64 bits of nanoseconds can tell.
    std::optional<uint64_t> timeNs(size_t second, size_t microsecond, size_t nanosecond) const
    {
        constexpr uint64_t kLastSecond = 18'000'000'000;
        const uint64_t whole = seconds(second);
        const uint32_t microseconds = word(microsecond);
        const uint32_t nanoseconds = word(nanosecond);
        if (whole > kLastSecond || microseconds >= 1'000'000) return std::nullopt;
        const bool finer = nanoseconds / 1000 == microseconds;
        return whole * kSecondNs + (finer ? nanoseconds : microseconds * 1000);
    }

    const std::function<uint32_t(size_t)>& word;
    const tLayout& layout;
    bool wide;
};

[[noreturn]] void fail(int failure, int unit, key_t key, const char* deed)
{
    throw std::system_error(
        failure, std::generic_category(),
        fmt::format("cannot {} the shared memory segment of unit {} ({:#x})", deed, unit, key));
}

// One that is there already has the size that its maker gave it. By custom the first two units are
// for producers of the same user only.
int openSegment(int unit, key_t key)
{
    constexpr int kFirstOfAll = 2;
    const int mode = unit < kFirstOfAll ? 0600 : 0666;
    const int there = shmget(key, 0, 0);
    if (there >= 0) return there;
    if (errno != ENOENT) fail(errno, unit, key, "open");
    const size_t size = sizeof(time_t) > 4 ? kWide.size : kNarrow.size;
    const int made = shmget(key, size, IPC_CREAT | mode);
    if (made < 0) fail(errno, unit, key, "make");
    return made;
}

tSharedMemoryReference::tSharedMemoryReference(int unit, key_t firstKey)
{
    const key_t key = firstKey + unit;
    const int id = openSegment(unit, key);
    shmid_ds state{};
    if (shmctl(id, IPC_STAT, &state) != 0) fail(errno, unit, key, "look at");
    wide = state.shm_segsz == kWide.size;
    if (!wide && state.shm_segsz != kNarrow.size) {
        throw std::runtime_error(
            fmt::format("the shared memory segment of unit {} has {} bytes, neither {} nor {}",
                        unit, state.shm_segsz, kNarrow.size, kWide.size));
    }
    void* const attached = shmat(id, nullptr, 0);
    if (attached == reinterpret_cast<void*>(-1)) // NOLINT(performance-no-int-to-ptr): its failure
        fail(errno, unit, key, "attach");
    segment = static_cast<unsigned char*>(attached);
}

tSharedMemoryReference::~tSharedMemoryReference() { (void)shmdt(segment); }

// Nobody tells when a sample comes.
std::optional<tReferenceSample> tSharedMemoryReference::next(int64_t atMostNs)
{
    if (const auto sample = take()) return sample;
    nap(std::min(atMostNs, pace.napNs(static_cast<int64_t>(rawTimeNs()))));
    return take();
}

// What the other side writes meanwhile is loaded in the order of the calls.
std::optional<tReferenceSample> tSharedMemoryReference::take()
{
    const auto word = [this](size_t offset) {
        return __atomic_load_n(wordAt(offset), __ATOMIC_ACQUIRE);
    };
    const size_t valid = layoutOf(wide).valid;
    if (word(valid) == 0) return std::nullopt;
    const auto sample = sampleInSegment(word, wide);
    __atomic_store_n(wordAt(valid), 0U, __ATOMIC_RELEASE); // taken
    pace.taken(static_cast<int64_t>(rawTimeNs()));
    if (!sample) ++unusableCount;
    return sample;
}

} // namespace

// In mode 1 a producer that is at work meanwhile shows in the count; in mode 0 it waits for its
// turn.
std::optional<tReferenceSample> sampleInSegment(const std::function<uint32_t(size_t)>& word,
                                                bool wide)
{
    const tSegmentView view(word, wide);
    const uint32_t mode = word(kMode);
    const uint32_t countBefore = word(kCount);
    const auto systemNs = view.systemNs();
    const auto referenceNs = view.referenceNs();
    const uint32_t leap = word(layoutOf(wide).leap);
    const bool undisturbed = mode == 0 || (mode == 1 && word(kCount) == countBefore);
    if (undisturbed && systemNs && referenceNs && leap != kNotSynchronised)
        return tReferenceSample{*systemNs, *referenceNs, false};
    return std::nullopt;
}

std::unique_ptr<iReference> sharedMemoryReference(int unit, int firstKey)
{
    return std::make_unique<tSharedMemoryReference>(unit, firstKey);
}

} // namespace dravikHost
