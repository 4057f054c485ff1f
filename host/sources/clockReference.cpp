#include "sources/iReference.h"

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
    tClockReference(int64_t intervalNs, std::function<tCrossReading()> reader, uint64_t (*rawNs)())
        : intervalNs(intervalNs), reader(std::move(reader)), rawNs(rawNs)
    {}

    // A reading that fails is a reference that is silent.
    std::optional<tReferenceSample> next(int64_t atMostNs) override;
    int64_t unusable() const override { return failures; }

private:
    int64_t intervalNs;
    std::function<tCrossReading()> reader;
    uint64_t (*rawNs)();
    std::optional<int64_t> dueNs; // by rawNs
    int64_t failures = 0;
};

// A machine that slept through several readings leaves them out instead of crowding them.
std::optional<tReferenceSample> tClockReference::next(int64_t atMostNs)
{
    const auto nowNs = [this] { return static_cast<int64_t>(rawNs()); };
    if (!dueNs) dueNs = nowNs();
    const int64_t remainingNs = *dueNs - nowNs();
    if (remainingNs > 0) nap(remainingNs < atMostNs ? remainingNs : atMostNs);
    const int64_t lateNs = nowNs() - *dueNs;
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

std::unique_ptr<iReference>
clockReference(int64_t intervalNs, std::function<tCrossReading()> reader, uint64_t (*rawNs)())
{
    return std::make_unique<tClockReference>(intervalNs, std::move(reader), rawNs);
}

} // namespace dravikHost
