#include "traces/tRecording.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <stdexcept>

namespace dravikHost {

void keepLongestStretch(tRecording& recording)
{
    auto& pairs = recording.pairs;
    size_t bestStart = 0;
    size_t bestEnd = 0;
    for (size_t start = 0; start < pairs.size();) {
        size_t end = start + 1;
        while (end < pairs.size() && !pairs[end].beginsStretch)
            ++end;
        if (end - start > bestEnd - bestStart) {
            bestStart = start;
            bestEnd = end;
        }
        start = end;
    }
    if (bestEnd - bestStart == pairs.size()) return;
    recording.notes.push_back(fmt::format("only the longest stretch is used, {} of {} measurements",
                                          bestEnd - bestStart, pairs.size()));
    const int64_t startNs = pairs[bestStart].elapsedNs;
    pairs = {pairs.begin() + static_cast<std::ptrdiff_t>(bestStart),
             pairs.begin() + static_cast<std::ptrdiff_t>(bestEnd)};
    pairs.front().beginsStretch = false;
    for (tRecordedPair& pair : pairs)
        pair.elapsedNs -= startNs;
}

void requireCorrections(const tRecording& recording)
{
    for (const tRecordedPair& pair : recording.pairs) {
        if (pair.orderedPpb) continue;
        throw std::runtime_error(
            fmt::format("{} does not tell what frequency the clock was given, so its corrections "
                        "cannot be undone; if it had none, say --free-running",
                        recording.name));
    }
}

double ownErrorNs(const tRecordedPair& from, const tRecordedPair& to)
{
    const double seconds = secondsOf(to.elapsedNs - from.elapsedNs);
    const double correctedNs = static_cast<double>(from.stepNs) + *from.orderedPpb * seconds;
    return to.errorNs - from.errorNs - correctedNs;
}

} // namespace dravikHost
