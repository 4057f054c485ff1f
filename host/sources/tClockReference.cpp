#include "sources/tClockReference.h"

#include "clocks/systemTime.h"

#include <system_error>

namespace dravikHost {

// A machine that slept through several readings leaves them out instead of crowding them.
std::optional<tReferenceSample> tClockReference::next(int64_t atMostNs)
{
    const auto rawNs = [] { return static_cast<int64_t>(rawTimeNs()); };
    if (!dueNs) dueNs = rawNs();
    const int64_t remainingNs = *dueNs - rawNs();
    if (remainingNs > 0) nap(remainingNs < atMostNs ? remainingNs : atMostNs);
    const int64_t lateNs = rawNs() - *dueNs;
    if (lateNs < 0) return std::nullopt;
    *dueNs += intervalNs * (1 + (lateNs + intervalNs / 2) / intervalNs);
    try {
        const tCrossReading reading = reader();
        return tReferenceSample{reading.systemNs, reading.clockNs, false};
    } catch (const std::system_error&) {
        ++failures;
        return std::nullopt;
    }
}

} // namespace dravikHost
