#include "loop/tProgress.h"

#include <cstdio>
#include <unistd.h>

namespace {

constexpr auto kPause = std::chrono::milliseconds(100);
constexpr const char* kEraseLine = "\r\x1b[K";

// Progress that cannot be shown is no failure.
void put(const std::string& text)
{
    (void)std::fputs(text.c_str(), stderr);
    (void)std::fflush(stderr);
}

} // namespace

tProgress::tProgress() : enabled(isatty(STDERR_FILENO) == 1) {}

tProgress::~tProgress() { clear(); }

bool tProgress::due() const { return enabled && std::chrono::steady_clock::now() >= nextTime; }

void tProgress::show(const std::string& text)
{
    put(kEraseLine + text);
    shown = true;
    nextTime = std::chrono::steady_clock::now() + kPause;
}

void tProgress::clear()
{
    if (shown) put(kEraseLine);
    shown = false;
}
