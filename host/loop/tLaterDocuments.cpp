#include "loop/tLaterDocuments.h"

#include "servo/tuning.h"

#include <fmt/format.h>

// Every document is applied once before the first pair: a file that would be refused in the middle
// of a run is refused at its start.
tLaterDocuments::tLaterDocuments(tServoHost& servo, const std::vector<tLaterDocument>& options)
    : host(&servo)
{
    if (options.empty()) return;
    firstTuning = host->readConfig();
    for (const tLaterDocument& option : options)
        documents.push_back({option, applyConfigFile(*host, option.file)});
    host->writeConfig(firstTuning);
}

std::string tLaterDocuments::observe(int64_t elapsedNs, bool locked)
{
    if (!locked) {
        lockedSinceNs.reset();
        if (applied == 0) return "";
        applied = 0;
        host->writeConfig(firstTuning);
        return "tuned as at the start";
    }
    if (!lockedSinceNs) lockedSinceNs = elapsedNs;
    if (applied == documents.size() ||
        elapsedNs - *lockedSinceNs < documents[applied].option.afterNs)
        return "";
    const tDocument& next = documents[applied++];
    host->writeConfig(next.text);
    return fmt::format("tuned by {}", next.option.file);
}
