#include "servo/tuning.h"

#include "servo/configDocument.h"
#include "servo/defaultDocument.h"
#include "text/files.h"

#include <fmt/format.h>

#include <stdexcept>

namespace dravikHost {

namespace {

// The name is the type's or the file's.
void applyMetaData(tServoHost& host, const std::string& metaData, const std::string& name,
                   tNotes& notes)
{
    const tDefaultDocument document = applyAndListen(host, metaData);
    if (!document.failure.empty())
        throw std::runtime_error(fmt::format("{}: {}", name, document.failure));
    if (!document.isLogged) return;
    if (document.file.empty()) {
        notes.push_back(fmt::format("{}: loads no default document; the types '{}' do", name,
                                    fmt::join(typesWithDocument(), "' and '")));
    } else if (document.unreadable) {
        notes.push_back(fmt::format("{}: its default document {} cannot be read, so the values "
                                    "stay as they were",
                                    name, document.file));
    }
}

} // namespace

tNotes tune(tServoHost& host, const tTuning& tuning)
{
    tNotes notes;
    if (tuning.metaDataFile)
        applyMetaData(host, readText(*tuning.metaDataFile), *tuning.metaDataFile, notes);
    if (tuning.referenceType) {
        applyMetaData(host, metaDataOf(*tuning.referenceType),
                      fmt::format("type '{}'", *tuning.referenceType), notes);
    }
    if (tuning.configFile) applyConfigFile(host, *tuning.configFile, notes);
    return notes;
}

std::string applyConfigFile(tServoHost& host, const std::string& path, tNotes& notes)
{
    std::string text = readText(path);
    try {
        host.writeConfig(text);
    } catch (const std::runtime_error& failure) {
        throw std::runtime_error(fmt::format("{}: {}", path, failure.what()));
    }
    for (const std::string& note : documentNotes(text))
        notes.push_back(fmt::format("{}: {}", path, note));
    return text;
}

} // namespace dravikHost
