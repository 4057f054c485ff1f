#include "dravik/tTimeSpan.h"

#include "dravik/saturate.h"

#include <cmath>

namespace zvckmDravik {

namespace {

constexpr uint64_t kNanosecondsPerSecond = 1000000000U;

// Two's complement, in unsigned arithmetic: wraps where signed arithmetic would be undefined.
uint64_t signedBits(uint64_t magnitude, int32_t sign)
{
    return sign < 0 ? 0 - magnitude : magnitude;
}

} // namespace

tTimeSpan::tTimeSpan(const int64_t& nanoseconds)
    : magnitude(signedBits(static_cast<uint64_t>(nanoseconds), nanoseconds < 0 ? -1 : +1)),
      sign(nanoseconds < 0 ? -1 : +1)
{}

tTimeSpan::tTimeSpan(const double& seconds) : sign(seconds >= 0 ? +1 : -1)
{
    const double absolute = std::fabs(seconds);
    setSeconds(saturateToUint32(absolute));
    const double rest = absolute - static_cast<double>(static_cast<uint32_t>(getSeconds()));
    setNanoseconds(saturateToUint32(rest * 1e9));
}

uint64_t tTimeSpan::getSeconds() const { return magnitude / kNanosecondsPerSecond; }

uint32_t tTimeSpan::getNanoseconds() const
{
    return static_cast<uint32_t>(magnitude % kNanosecondsPerSecond);
}

void tTimeSpan::setSeconds(uint32_t seconds)
{
    magnitude = getNanoseconds() + kNanosecondsPerSecond * seconds;
}

void tTimeSpan::setNanoseconds(uint32_t nanoseconds)
{
    magnitude = magnitude + nanoseconds - getNanoseconds();
}

int64_t tTimeSpan::toNanoseconds() const
{
    return static_cast<int64_t>(signedBits(magnitude, sign));
}

double tTimeSpan::toSeconds() const
{
    return static_cast<double>(magnitude) / 1e9 * static_cast<double>(sign);
}

bool operator>(const tTimeSpan& a, const tTimeSpan& b)
{
    if (a.getSign() != b.getSign()) return a.getSign() > b.getSign();
    return a.getSign() > 0 ? a.getMagnitude() > b.getMagnitude()
                           : a.getMagnitude() < b.getMagnitude();
}

bool operator>=(const tTimeSpan& a, const tTimeSpan& b) { return !(b > a); }

tTimeSpan operator-(const tTimeSpan& a, const tTimeSpan& b)
{
    const uint64_t difference =
        static_cast<uint64_t>(a.toNanoseconds()) - static_cast<uint64_t>(b.toNanoseconds());
    return tTimeSpan(static_cast<int64_t>(difference));
}

} // namespace zvckmDravik
