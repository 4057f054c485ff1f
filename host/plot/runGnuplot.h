#pragma once

#include <string>

namespace dravikHost {

// Hands a script to gnuplot and waits for it. Throws std::runtime_error if it cannot be started or
// does not succeed.
void runGnuplot(const std::string& script);

} // namespace dravikHost
