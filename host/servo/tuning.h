#pragma once

#include "servo/tServoHost.h"

#include <optional>
#include <string>

namespace dravikHost {

// What a servo is given before its first pair. Files may be "-", the standard input.
struct tTuning {
    std::optional<std::string> metaDataFile;
    std::optional<std::string> referenceType; // instead of a file of metadata
    std::optional<std::string> configFile;
};

// The metadata come first, so that the document given wins over the default one of their type.
// Throws std::runtime_error that tells what could not be read, or was refused and why.
void tune(tServoHost& host, const tTuning& tuning);

// Returns the text of the file.
std::string applyConfigFile(tServoHost& host, const std::string& path);

} // namespace dravikHost
