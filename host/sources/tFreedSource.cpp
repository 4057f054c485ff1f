#include "sources/tFreedSource.h"

#include <fmt/format.h>

#include <stdexcept>

namespace {

// By how much the oscillator and the noise, without the corrections, changed the error.
double ownErrorNs(const tRecordedPair& from, const tRecordedPair& to)
{
    const double seconds = static_cast<double>(to.elapsedNs - from.elapsedNs) * 1e-9;
    const double correctedNs = static_cast<double>(from.stepNs) + *from.orderedPpb * seconds;
    return to.errorNs - from.errorNs - correctedNs;
}

} // namespace

tFreedSource::tFreedSource(const tRecording& recorded, tFreedClock& freedClock)
    : recording(recorded), clock(freedClock)
{
    for (const tRecordedPair& pair : recording.pairs) {
        if (pair.orderedPpb) continue;
        throw std::runtime_error(
            fmt::format("{} does not tell what frequency the clock was given, so its corrections "
                        "cannot be undone",
                        recording.name));
    }
}

std::optional<tPair> tFreedSource::next()
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
    return tPair{pair.elapsedNs, pair.referenceNs, clockNs, trueErrorNs};
}
