#pragma once

namespace zvckmDravik {

// Keeps a value within limits that nobody has compared: the maximum is tested first, which tells if
// they cross, and a value that is not a number stays what it is.
inline double clampMaximumFirst(double value, double max, double min)
{
    if (value > max) return max;
    if (value < min) return min;
    return value;
}

} // namespace zvckmDravik
