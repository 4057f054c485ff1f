#pragma once

#include <cstdint>
#include <optional>

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

} // namespace dravikHost
