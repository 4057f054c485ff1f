#pragma once

#include "clocks/iClock.h"
#include "sources/iReference.h"

#include <functional>
#include <utility>

namespace dravikHost {

// A clock of this machine, read at a pace of our own.
class tClockReference : public iReference
{
public:
    tClockReference(int64_t intervalNs, std::function<tCrossReading()> reader)
        : intervalNs(intervalNs), reader(std::move(reader))
    {}

    // A reading that fails is a reference that is silent.
    std::optional<tReferenceSample> next(int64_t atMostNs) override;
    int64_t unusable() const override { return failures; }

private:
    int64_t intervalNs;
    std::function<tCrossReading()> reader;
    std::optional<int64_t> dueNs; // by CLOCK_MONOTONIC_RAW
    int64_t failures = 0;
};

} // namespace dravikHost
