#include "sources/recordedSources.h"

namespace dravikHost {

std::optional<tMoment> tRecordedSource::next()
{
    if (index == recording.pairs.size()) return std::nullopt;
    if (index > 0 && recording.pairs[index - 1].orderedPpb)
        clock.showOffset(*recording.pairs[index - 1].orderedPpb);
    const tRecordedPair& pair = recording.pairs[index++];
    clock.showTime(pair.clockNs);
    return tMoment{pair.elapsedNs,
                   tPair{pair.elapsedNs, pair.referenceNs, pair.clockNs, pair.trueErrorNs}};
}

tFreeRunningSource::tFreeRunningSource(const tRecording& recording, tFreeRunningClock& clock)
    : recording(recording), clock(clock)
{
    requireCorrections(recording);
}

std::optional<tMoment> tFreeRunningSource::next()
{
    if (index == recording.pairs.size()) return std::nullopt;
    const tRecordedPair& pair = recording.pairs[index];
    if (index > 0) {
        const tRecordedPair& before = recording.pairs[index - 1];
        clock.advance(pair.elapsedNs - before.elapsedNs, ownErrorNs(before, pair));
    }
    ++index;
    // The clock passed the elapsed time, whatever steps the reference may have made of its own.
    const uint64_t nominalNs =
        recording.pairs[0].referenceNs + static_cast<uint64_t>(pair.elapsedNs);
    const uint64_t clockNs = clock.timeNs() - nominalNs + pair.referenceNs;
    std::optional<double> trueErrorNs;
    if (pair.trueErrorNs)
        trueErrorNs = clock.aheadOfNs(nominalNs) - (pair.errorNs - *pair.trueErrorNs);
    return tMoment{pair.elapsedNs, tPair{pair.elapsedNs, pair.referenceNs, clockNs, trueErrorNs}};
}

} // namespace dravikHost
