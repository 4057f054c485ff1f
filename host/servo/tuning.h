#pragma once

#include "servo/tServoHost.h"

#include <optional>
#include <string>
#include <vector>

namespace dravikHost {

// What a servo is given before its first pair. Files may be "-", the standard input.
struct tTuning {
    std::optional<std::string> metaDataFile;
    std::optional<std::string> referenceType; // instead of a file of metadata
    std::optional<std::string> configFile;
};

// Things that a person should know, a line each.
using tNotes = std::vector<std::string>;

// The metadata come first, so that the document given wins over the default one of their type.
// Returns what has no effect or another one than it seems. Throws std::runtime_error that says what
// could not be read, or was refused and why.
tNotes tune(tServoHost& host, const tTuning& tuning);

// Returns the text of the file, and adds to the notes.
std::string applyConfigFile(tServoHost& host, const std::string& path, tNotes& notes);

} // namespace dravikHost
