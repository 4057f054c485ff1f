#include "servo/tuning.h"

#include "text/files.h"
#include "text/json.h"

#include <fmt/format.h>

#include <stdexcept>

namespace dravikHost {

namespace {

std::string metaDataOf(const std::string& referenceType)
{
    const std::string reference = tJsonObject().add("type", jsonQuoted(referenceType)).line();
    const std::string references = tJsonObject().add("selected", reference).line();
    return tJsonObject().add("selectedTRInstID", "\"selected\"").add("TRs", references).line();
}

// Hands over the text of a file and returns it; a failure names the file.
std::string handOver(tServoHost& host, void (tServoHost::*take)(const std::string&),
                     const std::string& path)
{
    std::string text = readText(path);
    try {
        (host.*take)(text);
    } catch (const std::runtime_error& failure) {
        throw std::runtime_error(fmt::format("{}: {}", path, failure.what()));
    }
    return text;
}

} // namespace

void tune(tServoHost& host, const tTuning& tuning)
{
    if (tuning.metaDataFile) handOver(host, &tServoHost::applyMetaData, *tuning.metaDataFile);
    if (tuning.referenceType) host.applyMetaData(metaDataOf(*tuning.referenceType));
    if (tuning.configFile) applyConfigFile(host, *tuning.configFile);
}

std::string applyConfigFile(tServoHost& host, const std::string& path)
{
    return handOver(host, &tServoHost::writeConfig, path);
}

} // namespace dravikHost
