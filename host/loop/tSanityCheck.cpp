#include "loop/tSanityCheck.h"

#include <fmt/format.h>

#include <cmath>

namespace dravikHost {

std::string tSanityCheck::look(const tPair& pair, int64_t steppedNs)
{
    const tMoments now = {pair.elapsedNs, pair.referenceNs,
                          pair.clockNs - static_cast<uint64_t>(steppedNs)};
    std::string wrong;
    if (last) {
        const int64_t rawNs = now.rawNs - last->rawNs;
        wrong = compare("the reference", now.referenceNs - last->referenceNs, rawNs);
        if (wrong.empty()) wrong = compare("the clock", now.clockNs - last->clockNs, rawNs);
    }
    last = now;
    return wrong;
}

// A leap of less than this is a matter of noise, however short the time.
std::string tSanityCheck::compare(const char* name, uint64_t passedNs, int64_t rawNs) const
{
    constexpr double kNoiseNs = 1e6;
    const auto leapNs = static_cast<double>(static_cast<int64_t>(passedNs) - rawNs);
    if (std::fabs(leapNs) <= kNoiseNs + limit * static_cast<double>(rawNs)) return "";
    return fmt::format("{} leapt by {} against CLOCK_MONOTONIC_RAW", name,
                       signedDurationText(leapNs));
}

} // namespace dravikHost
