#pragma once

#include <cstdint>
#include <optional>
#include <string>

// Watches reference and clock against CLOCK_MONOTONIC_RAW, which nobody steers or steps: either of
// them may be off by a rate, but what leaps is not what it says to be.
class tSanityCheck
{
public:
    explicit tSanityCheck(double limitPpb) : limit(limitPpb * 1e-9) {}

    // Moments of one pair; what the servo itself has stepped the clock by in all is taken out.
    // Returns what is wrong with it, for people; mostly "".
    std::string look(int64_t rawNs, uint64_t referenceNs, uint64_t clockNs, int64_t steppedNs);

private:
    struct tMoments {
        int64_t rawNs;
        uint64_t referenceNs;
        uint64_t clockNs; // without steps
    };
    std::string compare(const char* name, uint64_t passedNs, int64_t rawNs) const;

    double limit;
    std::optional<tMoments> last;
};
