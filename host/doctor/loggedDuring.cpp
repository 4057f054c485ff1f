#include "doctor/loggedDuring.h"

#include "clocks/tDescriptor.h"

#include <array>
#include <cerrno>
#include <cstdio>
#include <exception>
#include <memory>
#include <syslog.h>
#include <system_error>

namespace {

using tFile = std::unique_ptr<std::FILE, decltype(&std::fclose)>;

std::string contentOf(std::FILE* file)
{
    std::rewind(file);
    std::string text;
    std::array<char, 512> part{};
    while (const size_t size = std::fread(part.data(), 1, part.size(), file))
        text.append(part.data(), size);
    return text;
}

} // namespace

// The C library copies the system log to the standard error output on request, and that can be led
// into a file.
tLogged loggedDuring(const std::function<void()>& action)
{
    const tFile file(std::tmpfile(), std::fclose);
    const tDescriptor standardError(dup(STDERR_FILENO));
    if (!file || standardError.get() < 0)
        throw std::system_error(errno, std::generic_category(), "cannot catch the system log");
    openlog("dravik-host", LOG_PERROR, LOG_USER);
    dup2(fileno(file.get()), STDERR_FILENO);
    tLogged logged;
    try {
        action();
    } catch (const std::exception& failure) {
        logged.failure = failure.what();
    }
    dup2(standardError.get(), STDERR_FILENO);
    closelog();
    logged.log = contentOf(file.get());
    return logged;
}
