#include "loop/tLaterDocuments.h"

#include "servo/tuning.h"

#include <fmt/format.h>

#include <algorithm>

namespace dravikHost {

// Every document is applied once before the first pair: a file that would be refused in the middle
// of a run is refused at its start.
tLaterDocuments::tLaterDocuments(tServoHost& servo, const std::vector<tLaterDocument>& options)
    : firstTuning(tServoParameters::of(servo.readConfig()))
{
    for (const tLaterDocument& option : options) {
        applyConfigFile(servo, option.file, found);
        documents.push_back({option, tServoParameters::of(servo.readConfig())});
    }
}

double tLaterDocuments::widestThreshold() const
{
    double widest = firstTuning.snapTimeThreshold;
    for (const tDocument& document : documents)
        widest = std::max(widest, document.parameters.snapTimeThreshold);
    return widest;
}

std::optional<tTuningChange> tLaterDocuments::observe(int64_t elapsedNs, bool locked)
{
    if (!locked) {
        lockedSinceNs.reset();
        if (applied == 0) return std::nullopt;
        applied = 0;
        return tTuningChange{firstTuning, "tuned as at the start"};
    }
    if (!lockedSinceNs) lockedSinceNs = elapsedNs;
    if (applied == documents.size() ||
        elapsedNs - *lockedSinceNs < documents[applied].option.afterNs)
        return std::nullopt;
    const tDocument& next = documents[applied++];
    return tTuningChange{next.parameters, fmt::format("tuned by {}", next.option.file)};
}

} // namespace dravikHost
