#pragma once

#include <map>
#include <string>

// The default document of each known type of time reference: from the type's name to the file's
// full path. Built while the library is loaded, from where the manager's files lie then, and only
// read afterwards. A type whose path could not be worked out is missing.
extern const std::map<std::string, std::string> defaultConfigFiles;

// The paths of the two files. Each works out the manager's directories anew; raise what the file
// system raises when it cannot tell whether a directory is there.
std::string getTabConfigPath();
std::string getBcConfigPath();
