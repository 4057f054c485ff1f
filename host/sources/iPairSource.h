#pragma once

#include <cstdint>
#include <optional>

// The time of the reference and of the clock at one moment.
struct tPair {
    int64_t elapsedNs; // since the start
    uint64_t referenceNs;
    uint64_t clockNs;
    std::optional<double> trueErrorNs; // known to a simulation only

    // Positive: the clock is ahead of the reference.
    int64_t errorNs() const { return static_cast<int64_t>(clockNs - referenceNs); }
};

// Where pairs come from, one after the other.
class iPairSource
{
public:
    virtual ~iPairSource() = default;

    // Blocks until the next pair is due; nothing at the end.
    virtual std::optional<tPair> next() = 0;
};
