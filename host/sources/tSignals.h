#pragma once

#include <csignal>

namespace dravikHost {

// While it lives, SIGINT, SIGTERM and SIGHUP interrupt a sleep and are remembered instead of ending
// the program. One at a time.
class tSignals
{
public:
    tSignals();
    tSignals(const tSignals&) = delete;
    tSignals& operator=(const tSignals&) = delete;
    ~tSignals();

    bool stopRaised() const; // SIGINT or SIGTERM
    bool takeReload();       // SIGHUP since the last time asked

private:
    struct sigaction previousInterrupt;
    struct sigaction previousTerminate;
    struct sigaction previousHangUp;
};

} // namespace dravikHost
