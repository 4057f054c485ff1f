#include "watchers/tConsole.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <cstdio>
#include <unistd.h>

namespace dravikHost {

namespace {

constexpr auto kPause = std::chrono::milliseconds(100);
constexpr const char* kEraseLine = "\r\x1b[K";

// Progress that cannot be shown is not a failure.
void put(const std::string& text)
{
    (void)std::fputs(text.c_str(), stderr);
    (void)std::fflush(stderr);
}

std::string atTime(int64_t elapsedNs, const std::string& text)
{
    return fmt::format("{:>10} s  {}", secondsText(elapsedNs, 3), text);
}

} // namespace

tConsole::tConsole(bool stdoutTaken)
    : output(stdoutTaken ? tOutputFile::standardError() : tOutputFile("-")),
      onTerminal(isatty(STDERR_FILENO) == 1)
{}

tConsole::~tConsole() { clearProgress(); }

void tConsole::print(const std::string& text)
{
    clearProgress();
    output.write(text);
    output.flush(); // it may be read through a pipe while the run goes on
}

void tConsole::note(int64_t elapsedNs, const std::string& text)
{
    print(atTime(elapsedNs, text) + "\n");
}

void tConsole::progress(int64_t elapsedNs, const std::function<std::string()>& text)
{
    if (!onTerminal || std::chrono::steady_clock::now() < nextTime) return;
    put(kEraseLine + atTime(elapsedNs, text()));
    shown = true;
    nextTime = std::chrono::steady_clock::now() + kPause;
}

void tConsole::clearProgress()
{
    if (shown) put(kEraseLine);
    shown = false;
}

} // namespace dravikHost
