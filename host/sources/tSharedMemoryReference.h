#pragma once

#include "sources/iReference.h"

#include <cstddef>

namespace dravikHost {

// Samples in a shared memory segment as NTP servers' drivers read it: one at a time, which the
// producer marks as valid and the consumer as taken. The producer may have a time_t of 32 or of 64
// bits, which the size of the segment tells.
class tSharedMemoryReference : public iReference
{
public:
    // Attaches the segment of that unit, or makes one for the producer to find. Throws
    // std::runtime_error.
    explicit tSharedMemoryReference(int unit);
    tSharedMemoryReference(const tSharedMemoryReference&) = delete;
    tSharedMemoryReference& operator=(const tSharedMemoryReference&) = delete;
    ~tSharedMemoryReference() override;

    std::optional<tReferenceSample> next(int64_t atMostNs) override;
    int64_t unusable() const override { return unusableCount; }

private:
    std::optional<tReferenceSample> take();

    unsigned char* segment = nullptr;
    bool wide = false; // time_t of 64 bits
    int64_t unusableCount = 0;
};

} // namespace dravikHost
