#pragma once

#include "sources/iPairSource.h"

#include <string>

// Now, and what there is.
struct tLiveMoment {
    int64_t elapsedNs; // since the start, by CLOCK_MONOTONIC_RAW
    std::optional<tPair> pair;
};

// Where pairs come from at the pace of real time, or do not.
class iLiveSource
{
public:
    virtual ~iLiveSource() = default;

    // Waits for the next pair, but for 100 ms at the most; nothing at the end.
    virtual std::optional<tLiveMoment> next() = 0;

    // What people should know of it in the end; "": nothing.
    virtual std::string remarks() const = 0;
};
