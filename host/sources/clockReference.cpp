#include "sources/iReference.h"

#include "clocks/iClock.h"
#include "clocks/systemTime.h"

#include <functional>
#include <system_error>
#include <utility>

namespace dravikHost {

namespace {

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

} // namespace

std::unique_ptr<iReference> clockReference(int64_t intervalNs,
                                           std::function<tCrossReading()> reader)
{
    return std::make_unique<tClockReference>(intervalNs, std::move(reader));
}

} // namespace dravikHost
