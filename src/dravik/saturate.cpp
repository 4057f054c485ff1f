#include "dravik/saturate.h"

#include <cmath>
#include <limits>

namespace {

template <class Integer> Integer saturate(double value)
{
    using limits = std::numeric_limits<Integer>; // 32 bits: both limits are exact as double
    if (value >= static_cast<double>(limits::max())) return limits::max();
    if (value <= static_cast<double>(limits::min())) return limits::min();
    return std::isnan(value) ? 0 : static_cast<Integer>(value);
}

} // namespace

int32_t saturateToInt32(double value) { return saturate<int32_t>(value); }

uint32_t saturateToUint32(double value) { return saturate<uint32_t>(value); }
