#pragma once

#include <csignal>

// While it lives, SIGINT and SIGTERM interrupt a sleep and are remembered instead of ending the
// program. One at a time.
class tStopSignal
{
public:
    tStopSignal();
    tStopSignal(const tStopSignal&) = delete;
    tStopSignal& operator=(const tStopSignal&) = delete;
    ~tStopSignal();

    bool raised() const;

private:
    struct sigaction previousInterrupt;
    struct sigaction previousTerminate;
};
