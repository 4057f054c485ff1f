#pragma once

#include <chrono>
#include <string>

// One line on a terminal's stderr, rewritten in place; elsewhere it is silent.
class tProgress
{
public:
    tProgress();
    tProgress(const tProgress&) = delete;
    tProgress& operator=(const tProgress&) = delete;
    ~tProgress();

    bool due() const; // at most ten times a second
    void show(const std::string& text);
    void clear(); // before anything else is written

private:
    bool enabled;
    bool shown = false;
    std::chrono::steady_clock::time_point nextTime;
};
