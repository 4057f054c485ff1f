#pragma once

#include <string>
#include <vector>

// What the code under test wrote to the system log since the last call of this: each line as
// "<priority> <text>". Nothing reaches the machine's own log.
std::vector<std::string> takeSystemLog();
