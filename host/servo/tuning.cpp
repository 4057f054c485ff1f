#include "servo/tuning.h"

#include "servo/json.h"
#include "text/readText.h"

#include <fmt/format.h>

#include <stdexcept>

namespace {

std::string metaDataOf(const std::string& referenceType)
{
    return fmt::format(R"({{"selectedTRInstID":"selected","TRs":{{"selected":{{"type":{}}}}}}})",
                       jsonQuoted(referenceType));
}

// Hands over the text of a file and returns it; a failure is told with the file's name.
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

void addTuningOptions(CLI::App& app, tTuning& tuning)
{
    CLI::Option* const metaData =
        app.add_option("--metadata", tuning.metaDataFile, "Metadata of the time reference")
            ->type_name("FILE");
    app.add_option("--reference-type", tuning.referenceType, "Metadata with no more than this type")
        ->type_name("TEXT")
        ->excludes(metaData);
    app.add_option("--config", tuning.configFile,
                   "Configuration document; goes last, so it\n"
                   "wins over a default document of the type")
        ->type_name("FILE");
    app.final_callback([&tuning] {
        if (tuning.metaDataFile == "-" && tuning.configFile == "-")
            throw CLI::ValidationError("--config", "the standard input is taken by --metadata");
    });
}

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
