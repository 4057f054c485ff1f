#pragma once

#include "loop/tRunningFigures.h"

#include <optional>

// What becomes of a clock whose reference is silent: it keeps the frequency that it was last given,
// and its error grows with what that frequency was unsure by.
class tHoldover
{
public:
    explicit tHoldover(int64_t silenceNs) : patienceNs(silenceNs) {}

    // Returns whether the silence has just become a holdover.
    bool silent(int64_t elapsedNs);
    void pair(const tPair& pair, bool locked, double orderedPpb);

    bool lasting() const { return since.has_value(); }
    int64_t lengthNs(int64_t elapsedNs) const { return since ? elapsedNs - *since : 0; }

    // By how far the clock may be off, one deviation; nothing if it has not been locked for long
    // enough to tell.
    std::optional<double> errorNs(int64_t elapsedNs) const;

private:
    static constexpr int64_t kWindow = 64; // pairs that tell how sure the frequency is
    static constexpr int64_t kLeast = 8;   // with fewer it cannot be told

    int64_t patienceNs;
    int64_t latestNs = 0; // when the latest pair came
    std::optional<int64_t> since;
    tRunningFigures window;   // being filled
    tRunningFigures previous; // full
};
