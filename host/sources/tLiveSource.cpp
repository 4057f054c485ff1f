#include "sources/tLiveSource.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <system_error>

namespace dravikHost {

tLiveSource::tLiveSource(iLiveClock& clock, iReference& reference, const tSignals& signals,
                         const tOptions& options)
    : clock(clock), reference(reference), signals(signals), options(options),
      startRawNs(options.rawNs())
{}

// A signal may also come between the test and the wait, where it interrupts nothing: hence naps.
// A sample from before the latest order describes a clock that has changed since.
std::optional<tMoment> tLiveSource::next()
{
    constexpr int64_t kNapNs = 100'000'000;
    if (!ordered) ordered = crossRead();
    const int64_t leftNs = options.durationNs ? *options.durationNs - elapsedNs() : kNapNs;
    const auto sample = reference.next(std::clamp<int64_t>(leftNs, 0, kNapNs));
    if (signals.stopRaised() || (options.durationNs && elapsedNs() >= *options.durationNs))
        return std::nullopt;
    if (!sample) return tMoment{elapsedNs(), {}, leftOut()};
    const auto now = crossRead();
    if (!ordered || !now) {
        ++unread;
        return tMoment{elapsedNs(), {}, leftOut()};
    }
    const bool even = ranEvenly(*now);
    const bool upToDate =
        sample->systemNs >= ordered->reading.systemNs && sample->systemNs <= now->reading.systemNs;
    if (even && upToDate) {
        const tPair pair = pairAt(*sample, *now);
        ordered.reset();
        return tMoment{pair.elapsedNs, pair, leftOut()};
    }
    ++outOfDate;
    if (!even) ordered = now;
    return tMoment{now->elapsedNs, {}, leftOut()};
}

std::string tLiveSource::remarks() const
{
    const tLeftOut samples = leftOut();
    if (samples.all() == 0) return "";
    return fmt::format("left out of the reference's samples: {} out of date, {} not usable",
                       samples.outOfDate, samples.unusable);
}

tLeftOut tLiveSource::leftOut() const { return {outOfDate, reference.unusable() + unread}; }

int64_t tLiveSource::elapsedNs() const
{
    return static_cast<int64_t>(options.rawNs() - startRawNs);
}

// Nothing if the reading fails, as one of a PTP clock may now and then; one that is gone is an end.
std::optional<tLiveSource::tReading> tLiveSource::crossRead()
{
    try {
        const tCrossReading reading = clock.crossRead();
        return tReading{elapsedNs(), reading};
    } catch (const std::system_error& failure) {
        if (failure.code() == std::errc::no_such_device) throw;
        return std::nullopt;
    }
}

// Whether the machine's clock was left alone by others, who may step it.
bool tLiveSource::ranEvenly(const tReading& now) const
{
    constexpr int64_t kReadingNs = 1'000'000;
    constexpr int64_t kFastest = 1000; // 1000 ppm
    const int64_t rawNs = now.elapsedNs - ordered->elapsedNs;
    const auto systemNs = static_cast<int64_t>(now.reading.systemNs - ordered->reading.systemNs);
    return std::llabs(systemNs - rawNs) <= kReadingNs + rawNs / kFastest;
}

// The clock has run evenly since it was last ordered anything.
tPair tLiveSource::pairAt(const tReferenceSample& sample, const tReading& now) const
{
    const tCrossReading& from = ordered->reading;
    const tCrossReading& to = now.reading;
    const auto agoNs = static_cast<double>(to.systemNs - sample.systemNs);
    const auto systemNs = static_cast<double>(to.systemNs - from.systemNs);
    const auto clockNs = static_cast<double>(static_cast<int64_t>(to.clockNs - from.clockNs));
    const double rate = systemNs > 0 ? clockNs / systemNs : 1;
    tPair pair{};
    pair.elapsedNs = std::max<int64_t>(now.elapsedNs - std::llround(agoNs), 0);
    pair.clockNs = to.clockNs - static_cast<uint64_t>(std::llround(agoNs * rate));
    pair.referenceNs = sample.referenceNs + static_cast<uint64_t>(options.referenceOffsetNs);
    if (!sample.pulse) return pair;
    constexpr double kWholeNs = kSecondNs;
    const double seconds = std::round(static_cast<double>(pair.errorNs()) / kWholeNs);
    pair.referenceNs += static_cast<uint64_t>(std::llround(seconds * kWholeNs));
    return pair;
}

} // namespace dravikHost
