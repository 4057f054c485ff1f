#include "dravik/defaultConfigFiles.h"
#include "dravik/tJsonConfig.h"
#include "dravik/tServo.h"
#include "dravik/timeReferenceMetaData.h"
#include "zvsdbg/debugLine.h"

#include <fstream>

// The configuration document, in and out, and the file that one is loaded from. It is one JSON
// object of numbers, the flag included, applied and given out in the order of the table of
// parameters. Every operation holds the lock from end to end.

namespace zvckmDravik {

namespace {

constexpr int32_t kAlwaysWritten = 0x2000;
constexpr tDebugLocation kAtReading = {"dravik/tServo", 434, "\n"};
constexpr tDebugLocation kAtUnableToRead = {"dravik/tServo", 444, "\n"};

// All lines of a file as one, without their line feeds. A file that cannot be read to its end gives
// what was read; exhausted memory is not such an end, and is raised.
std::string readLines(std::ifstream& file)
{
    std::string text;
    file.exceptions(std::ios::badbit); // getline would keep a bad_alloc to itself
    try {
        for (std::string line; std::getline(file, line);) {
            text += line;
        }
    } catch (const std::ios::failure&) { // NOLINT(bugprone-empty-catch): as told above
    }
    return text;
}

} // namespace

// Each value is stored before the next key is looked at; nothing is checked first or rolled back.
void tServo::writeServoConfigJson(const std::string& json)
{
    const tMutexGuard lock(mutex);
    const tJsonConfig config(json);
    const auto apply = [&](const char* key, auto get, auto set) {
        if (config.hasKey(key)) (this->*set)((config.*get)(key));
    };
#define APPLY(key, Key, Kind, ...) apply(#key, &tJsonConfig::get##Kind, &tServo::set##Key);
    ZVCKMSERVO_PARAMETERS(APPLY)
#undef APPLY
}

std::string tServo::readServoConfigJson()
{
    const tMutexGuard lock(mutex);
    tJsonConfig config;
#define ADD(key, Key, Kind, ...) config.set##Kind(#key, key);
    ZVCKMSERVO_PARAMETERS(ADD)
#undef ADD
    return config.toString();
}

void tServo::readConfigFile(const std::string& path)
{
    const tMutexGuard lock(mutex);
    std::ifstream file(path);
    if (!file.good()) {
        zvsdbg_line(kAlwaysWritten, &kAtUnableToRead, "Unable to read configuration from: %s",
                    path.c_str());
        return;
    }
    const std::string text = readLines(file);
    zvsdbg_line(kAlwaysWritten, &kAtReading, "Reading servo configuration from: %s", path.c_str());
    writeServoConfigJson(text);
}

void tServo::applyMetaData(const std::string& metaDataJson)
{
    const tMutexGuard lock(mutex);
    const std::string type = getSelectedTimeReferenceType(metaDataJson);
    if (type == timeReferenceType) return;
    timeReferenceType = type; // whatever becomes of the file
    const auto file = defaultConfigFiles.find(type);
    if (file != defaultConfigFiles.end()) readConfigFile(file->second);
}

} // namespace zvckmDravik
