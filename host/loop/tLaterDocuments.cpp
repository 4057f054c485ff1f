#include "loop/tLaterDocuments.h"

#include "servo/tuning.h"

#include <fmt/format.h>

namespace dravikHost {

// Every document is applied once before the first pair: a file that would be refused in the middle
// of a run is refused at its start.
tLaterDocuments::tLaterDocuments(tServoHost& servo, const std::vector<tLaterDocument>& options)
{
    if (options.empty()) return;
    firstTuning = servo.readConfig();
    for (const tLaterDocument& option : options)
        documents.push_back({option, applyConfigFile(servo, option.file, found)});
    servo.writeConfig(firstTuning);
}

std::string tLaterDocuments::observe(tServoHost& servo, int64_t elapsedNs, bool locked)
{
    if (!locked) {
        lockedSinceNs.reset();
        if (applied == 0) return "";
        applied = 0;
        servo.writeConfig(firstTuning);
        return "tuned as at the start";
    }
    if (!lockedSinceNs) lockedSinceNs = elapsedNs;
    if (applied == documents.size() ||
        elapsedNs - *lockedSinceNs < documents[applied].option.afterNs)
        return "";
    const tDocument& next = documents[applied++];
    servo.writeConfig(next.text);
    return fmt::format("tuned by {}", next.option.file);
}

} // namespace dravikHost
