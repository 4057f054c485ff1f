#include "sources/tLiveSource.h"

#include "clocks/systemTime.h"

#include <algorithm>
#include <limits>

namespace {

struct tReading {
    uint64_t rawNs;
    uint64_t referenceNs;
};

// Two clocks cannot be read at once: the reference is read between two readings of the raw clock
// and belongs to their middle. The closest pair of several is the one least disturbed.
tReading readBoth()
{
    constexpr int kAttempts = 9;
    tReading best{};
    uint64_t shortestNs = std::numeric_limits<uint64_t>::max();
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        const uint64_t beforeNs = systemTimeNs(CLOCK_MONOTONIC_RAW);
        const uint64_t referenceNs = systemTimeNs(CLOCK_REALTIME);
        const uint64_t bracketNs = systemTimeNs(CLOCK_MONOTONIC_RAW) - beforeNs;
        if (bracketNs < shortestNs) {
            shortestNs = bracketNs;
            best = {beforeNs + bracketNs / 2, referenceNs};
        }
    }
    return best;
}

} // namespace

tLiveSource::tLiveSource(tSoftClock& softClock, const tSignals& watched, int64_t paceNs,
                         std::optional<int64_t> lengthNs)
    : clock(softClock), signals(watched), intervalNs(paceNs), durationNs(lengthNs),
      startRawNs(systemTimeNs(CLOCK_MONOTONIC_RAW))
{}

// A signal may also come between the test and the sleep, where it interrupts nothing: hence naps.
std::optional<tLiveMoment> tLiveSource::next()
{
    constexpr int64_t kNapNs = 100'000'000;
    if (signals.stopRaised() || (durationNs && dueNs >= *durationNs)) return std::nullopt;
    const int64_t remainingNs = dueNs - elapsedNs();
    if (remainingNs > 0) {
        const timespec nap{0, static_cast<long>(std::min(remainingNs, kNapNs))};
        nanosleep(&nap, nullptr);
        if (remainingNs > kNapNs || signals.stopRaised()) return tLiveMoment{elapsedNs(), {}};
    }
    const tReading reading = readBoth();
    // A machine that slept through several pairs leaves them out instead of crowding them.
    dueNs += intervalNs * (1 + (elapsedNs() - dueNs + intervalNs / 2) / intervalNs);
    const auto atNs = static_cast<int64_t>(reading.rawNs - startRawNs);
    return tLiveMoment{atNs, tPair{atNs, reading.referenceNs, clock.timeAtRaw(reading.rawNs), {}}};
}

int64_t tLiveSource::elapsedNs() const
{
    return static_cast<int64_t>(systemTimeNs(CLOCK_MONOTONIC_RAW) - startRawNs);
}
