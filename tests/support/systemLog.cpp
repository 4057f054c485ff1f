#include "support/systemLog.h"

#include <cstdarg>
#include <cstdio>
#include <utility>

namespace {

// Written to by initialisers of other units too.
std::vector<std::string>& lines()
{
    static std::vector<std::string> kept;
    return kept;
}

void keep(int priority, const char* format, va_list arguments)
{
    char text[2048];
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): begun by the caller
    (void)std::vsnprintf(text, sizeof text, format, arguments);
    lines().push_back(std::to_string(priority) + " " + text);
}

} // namespace

// The linker sends syslog, which a hardened build calls by its second name, here (--wrap).
extern "C" void __wrap_syslog(int priority, const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    keep(priority, format, arguments);
    va_end(arguments);
}

extern "C" void __wrap___syslog_chk(int priority, int /*flag*/, const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    keep(priority, format, arguments);
    va_end(arguments);
}

std::vector<std::string> takeSystemLog() { return std::exchange(lines(), {}); }
