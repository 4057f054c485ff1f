#include "servo/defaultDocument.h"

#include "text/files.h"
#include "text/json.h"

#include <cstdio>
#include <exception>
#include <functional>
#include <syslog.h>

namespace dravikHost {

namespace {

struct tLogged {
    bool caught;
    std::string log;
    std::string failure;
};

std::string failureOf(const std::function<void()>& action)
{
    try {
        action();
    } catch (const std::exception& failure) {
        return failure.what();
    }
    return "";
}

// The C library copies the system log to the standard error output on request, and that can be led
// into a file.
tLogged loggedDuring(const std::function<void()>& action)
{
    const tFile file(std::tmpfile());
    const tDescriptor standardError(dup(STDERR_FILENO));
    if (!file || standardError.get() < 0) return {false, "", failureOf(action)};
    openlog("dravik-host", LOG_PERROR, LOG_USER);
    dup2(fileno(file.get()), STDERR_FILENO);
    const std::string failure = failureOf(action);
    dup2(standardError.get(), STDERR_FILENO);
    closelog();
    std::rewind(file.get());
    return {true, readToEnd(file.get(), "the system log"), failure};
}

// As the plug-in says in the system log: "... configuration from: FILE".
std::string fileIn(const std::string& log)
{
    constexpr std::string_view kBefore = "configuration from: ";
    const size_t found = log.find(kBefore);
    if (found == std::string::npos) return "";
    const size_t start = found + kBefore.size();
    return log.substr(start, log.find('\n', start) - start);
}

} // namespace

const std::vector<std::string>& typesWithDocument()
{
    static const std::vector<std::string> types = {"IEEE 802.1AS-2011 TAB", "IEEE 1588-2008 BC"};
    return types;
}

tDefaultDocument applyAndListen(tServoHost& host, const std::string& metaData)
{
    const tLogged logged = loggedDuring([&] { host.applyMetaData(metaData); });
    const bool unreadable = logged.log.find("Unable to read") != std::string::npos;
    return {fileIn(logged.log), unreadable, logged.failure, logged.caught};
}

std::string metaDataOf(const std::string& referenceType)
{
    const std::string reference = tJsonObject().add("type", jsonQuoted(referenceType)).line();
    const std::string references = tJsonObject().add("selected", reference).line();
    return tJsonObject().add("selectedTRInstID", "\"selected\"").add("TRs", references).line();
}

} // namespace dravikHost
