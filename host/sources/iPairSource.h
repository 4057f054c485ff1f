#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace dravikHost {

// The time of the reference and of the clock at one moment.
struct tPair {
    int64_t elapsedNs; // since the start
    uint64_t referenceNs;
    uint64_t clockNs;
    std::optional<double> trueErrorNs; // known to a simulation only

    // Positive: the clock is ahead of the reference.
    int64_t errorNs() const { return static_cast<int64_t>(clockNs - referenceNs); }
};

// Samples of a reference that became no pair, so far.
struct tLeftOut {
    int64_t outOfDate = 0; // from before the latest order to the clock, or from the future
    int64_t unusable = 0;  // as the reference itself says, or malformed

    int64_t all() const { return outOfDate + unusable; }
};

// A time, and the pair that came then, if any.
struct tMoment {
    int64_t elapsedNs; // since the start; in real time by CLOCK_MONOTONIC_RAW
    std::optional<tPair> pair;
    tLeftOut leftOut{};
};

// Where pairs come from.
class iPairSource
{
public:
    virtual ~iPairSource() = default;

    // Waits for the next pair, but for 100 ms at the most in real time; in time of its own making
    // a moment without a pair is one at which a pair was due. Nothing at the end.
    virtual std::optional<tMoment> next() = 0;

    // What people should know of it in the end; "": nothing.
    virtual std::string remarks() const { return ""; }
};

} // namespace dravikHost
