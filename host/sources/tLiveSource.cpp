#include "sources/tLiveSource.h"

#include "clocks/systemTime.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

tLiveSource::tLiveSource(iLiveClock& liveClock, iReference& liveReference, const tSignals& watched,
                         const tOptions& given)
    : clock(liveClock), reference(liveReference), signals(watched), options(given),
      startRawNs(systemTimeNs(CLOCK_MONOTONIC_RAW))
{}

// A signal may also come between the test and the wait, where it interrupts nothing: hence naps.
// A sample from before the latest order tells of a clock that is no more.
std::optional<tLiveMoment> tLiveSource::next()
{
    constexpr int64_t kNapNs = 100'000'000;
    if (!ordered) ordered = clock.crossRead();
    const int64_t leftNs = options.durationNs ? *options.durationNs - elapsedNs() : kNapNs;
    const auto sample = reference.next(std::clamp<int64_t>(leftNs, 0, kNapNs));
    if (signals.stopRaised() || (options.durationNs && elapsedNs() >= *options.durationNs))
        return std::nullopt;
    if (!sample) return tLiveMoment{elapsedNs(), {}};
    const tCrossReading now = clock.crossRead();
    if (sample->systemNs < ordered->systemNs || sample->systemNs > now.systemNs) {
        ++outOfDate;
        if (now.systemNs < ordered->systemNs) ordered = now; // the machine's clock was set back
        return tLiveMoment{elapsedNs(), {}};
    }
    const tPair pair = pairAt(*sample, now);
    ordered.reset();
    return tLiveMoment{pair.elapsedNs, pair};
}

std::string tLiveSource::remarks() const
{
    if (outOfDate == 0 && reference.unusable() == 0) return "";
    return fmt::format("left out of the reference's samples: {} out of date, {} not usable",
                       outOfDate, reference.unusable());
}

int64_t tLiveSource::elapsedNs() const
{
    return static_cast<int64_t>(systemTimeNs(CLOCK_MONOTONIC_RAW) - startRawNs);
}

// The clock has run evenly since it was last ordered anything.
tPair tLiveSource::pairAt(const tReferenceSample& sample, const tCrossReading& now) const
{
    constexpr double kSecondNs = 1e9;
    const auto agoNs = static_cast<double>(now.systemNs - sample.systemNs);
    const auto systemNs = static_cast<double>(now.systemNs - ordered->systemNs);
    const auto clockNs = static_cast<double>(static_cast<int64_t>(now.clockNs - ordered->clockNs));
    const double rate = systemNs > 0 ? clockNs / systemNs : 1;
    tPair pair{};
    pair.elapsedNs = std::max<int64_t>(elapsedNs() - std::llround(agoNs), 0);
    pair.clockNs = now.clockNs - static_cast<uint64_t>(std::llround(agoNs * rate));
    pair.referenceNs = sample.referenceNs + static_cast<uint64_t>(options.referenceOffsetNs);
    if (!sample.pulse) return pair;
    const double seconds = std::round(static_cast<double>(pair.errorNs()) / kSecondNs);
    pair.referenceNs += static_cast<uint64_t>(std::llround(seconds * kSecondNs));
    return pair;
}
