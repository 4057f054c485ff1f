#pragma once

#include "dravik/arithmetic.h"

#include <cstdint>

namespace zvckmDravik {

// A signed span of nanoseconds, kept as magnitude and sign, so that a host's timestamp fits whole:
// it is a span of sign +1. Timestamps are subtracted as integers; only the difference becomes
// seconds. Magnitude 0 with sign -1 can be held and compares below zero.
class tTimeSpan
{
public:
    tTimeSpan() = default;
    tTimeSpan(const uint64_t& magnitude, int32_t sign) : magnitude(magnitude), sign(sign) {}
    explicit tTimeSpan(const uint64_t& magnitude) : magnitude(magnitude) {}
    explicit tTimeSpan(const int64_t& nanoseconds);

    // Cuts fractions of a nanosecond off. Of no use beyond 4294967295 s either way; a value that is
    // not a number gives the negative zero.
    explicit tTimeSpan(const double& seconds);

    uint64_t getMagnitude() const { return magnitude; }
    int32_t getSign() const { return sign; }

    // Whole seconds of the magnitude, and the nanoseconds beyond them.
    uint64_t getSeconds() const;
    uint32_t getNanoseconds() const;

    // Replace one of the two; the sign stays. A second or more of nanoseconds carries over.
    void setSeconds(uint32_t seconds);
    void setNanoseconds(uint32_t nanoseconds);

    // Modulo 2^64.
    int64_t toNanoseconds() const;

    // Magnitudes beyond 2^53 ns lose their lowest bits.
    double toSeconds() const;

private:
    uint64_t magnitude = 0;
    int32_t sign = +1; // +1 or -1, never 0
};

// By sign first, so any positive span is greater than any negative one, zeros included.
bool operator>(const tTimeSpan& a, const tTimeSpan& b);
bool operator>=(const tTimeSpan& a, const tTimeSpan& b);

// Right as long as the true difference fits 64 bits with sign; wraps beyond.
tTimeSpan operator-(const tTimeSpan& a, const tTimeSpan& b);

} // namespace zvckmDravik
