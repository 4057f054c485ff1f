#include "traces/tRecording.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <stdexcept>

namespace dravikHost {

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
