#pragma once

#include "clocks/systemTime.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>

namespace dravikHost {

// What a reference said, and when.
struct tReferenceSample {
    uint64_t systemNs; // CLOCK_REALTIME at that moment
    uint64_t referenceNs;
    bool pulse; // whole seconds are not known
};

// Where the true time comes from.
class iReference
{
public:
    virtual ~iReference() = default;

    // Waits for a sample, but not for longer than that; may return early without one.
    virtual std::optional<tReferenceSample> next(int64_t atMostNs) = 0;

    // Samples so far that could not be used as they came.
    virtual int64_t unusable() const { return 0; }
};

// "realtime", "phc:DEVICE", "shm:UNIT" or "sock:PATH".
bool isReferenceName(const std::string& name);

// Whether it is read at the pace of this program; the others come at the producer's.
bool isReadOnDemand(const std::string& name);

// Throws std::runtime_error that names what cannot be opened.
std::unique_ptr<iReference> openReference(const std::string& name, int64_t intervalNs);

// The kinds of references, each in the file of its name. Their constructors may throw
// std::runtime_error. The clock is paced by CLOCK_MONOTONIC_RAW.
constexpr int kNtpSegmentKey = 0x4e545030; // of unit 0, the next units follow
std::unique_ptr<iReference> clockReference(int64_t intervalNs,
                                           std::function<tCrossReading()> reader,
                                           uint64_t (*rawNs)() = rawTimeNs);
std::unique_ptr<iReference> sharedMemoryReference(int unit, int firstKey = kNtpSegmentKey);
std::unique_ptr<iReference> socketReference(const std::string& path);

// The sample that lies in a segment; nothing if it cannot be used. The words are loaded one by one,
// by their offsets in bytes, as a producer may be at work meanwhile.
//   wide   the segment has a time_t of 64 bits
std::optional<tReferenceSample> sampleInSegment(const std::function<uint32_t(size_t)>& word,
                                                bool wide);

} // namespace dravikHost
