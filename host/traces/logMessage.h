#pragma once

#include <string>
#include <string_view>

namespace dravikHost {

// What a program said, and who it was, behind whatever a log put in front.
struct tLogMessage {
    std::string program; // "": not told
    std::string process; // host and number of the process, as far as they are told
    std::string seconds; // of the program's own stamp, "": none
    std::string text;
};

// A line of a program's output or of a system log, an object of journalctl -o json or of a
// container's log.
tLogMessage messageIn(std::string_view line);

} // namespace dravikHost
