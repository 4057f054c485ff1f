#pragma once

#include "sources/iPairSource.h"
#include "text/quantity.h"

#include <optional>
#include <string>

namespace dravikHost {

// Watches reference and clock against CLOCK_MONOTONIC_RAW, which nobody steers or steps: either of
// them may be off by a rate, but neither may leap.
class tSanityCheck
{
public:
    explicit tSanityCheck(double limitPpb) : limit(secondsOf(limitPpb)) {}

    // A pair's elapsed time is CLOCK_MONOTONIC_RAW's. The servo's own steps of the clock, their sum
    // so far, are taken out. Returns what is wrong with it, for people; mostly "".
    std::string look(const tPair& pair, int64_t steppedNs);

private:
    struct tMoments {
        int64_t rawNs;
        uint64_t referenceNs;
        uint64_t clockNs; // without steps
    };
    std::string compare(const char* name, uint64_t passedNs, int64_t rawNs) const;

    double limit; // a fraction
    std::optional<tMoments> last;
};

} // namespace dravikHost
