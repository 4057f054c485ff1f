#pragma once

#include <string>

namespace dravikHost {

// The text of a trace, "-" being the standard input, as far as it can be one. Throws
// std::runtime_error for what is compressed, in another encoding, endless or too large: memory
// stays bounded whatever is read.
std::string readTraceText(const std::string& path);

} // namespace dravikHost
