#include "sources/tRecordedSource.h"

std::optional<tPair> tRecordedSource::next()
{
    if (index == recording.pairs.size()) return std::nullopt;
    if (index > 0 && recording.pairs[index - 1].orderedPpb)
        clock.showOffset(*recording.pairs[index - 1].orderedPpb);
    const tRecordedPair& pair = recording.pairs[index++];
    clock.showTime(pair.clockNs);
    return tPair{pair.elapsedNs, pair.referenceNs, pair.clockNs, pair.trueErrorNs};
}
