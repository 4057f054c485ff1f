#pragma once

#include "text/files.h"

#include <chrono>
#include <functional>
#include <string>

namespace dravikHost {

// What the person at the terminal reads: lines that stay, and below them, on a terminal's stderr,
// one that is rewritten in place. The watchers of a run share it.
class tConsole
{
public:
    explicit tConsole(bool stdoutTaken); // then lines go to stderr
    tConsole(const tConsole&) = delete;
    tConsole& operator=(const tConsole&) = delete;
    ~tConsole();

    void print(const std::string& text);
    void note(int64_t elapsedNs, const std::string& text);

    // Asks for the text at most ten times a second, and never where there is no terminal.
    void progress(int64_t elapsedNs, const std::function<std::string()>& text);

private:
    void clearProgress();

    tOutputFile output;
    bool onTerminal;
    bool shown = false;
    std::chrono::steady_clock::time_point nextTime;
};

} // namespace dravikHost
