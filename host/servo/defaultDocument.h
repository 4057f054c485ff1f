#pragma once

#include "servo/tServoHost.h"

#include <string>
#include <vector>

namespace dravikHost {

// The types of references for which the plug-in has a default document.
const std::vector<std::string>& typesWithDocument();

// What the plug-in made of metadata: it loads a default document where the type calls for one, and
// says so in the system log only.
struct tDefaultDocument {
    std::string file;      // that it looked for; "": for none, or the log could not be caught
    bool unreadable;       // the file is not there, say: the values stay as they were
    std::string failure;   // of taking the metadata, or the document; "": none
    bool isLogged = false; // whether the log was caught, so that all this is known
};
tDefaultDocument applyAndListen(tServoHost& host, const std::string& metaData);

// Metadata with nothing but the type.
std::string metaDataOf(const std::string& referenceType);

} // namespace dravikHost
