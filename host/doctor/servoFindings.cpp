#include "clocks/tSteeredClock.h"
#include "doctor/findings.h"
#include "servo/tuning.h"
#include "text/files.h"

#include <fmt/format.h>

#include <cerrno>
#include <cstdio>
#include <ctime>
#include <exception>
#include <functional>
#include <string>
#include <syslog.h>
#include <system_error>

namespace dravikHost {

namespace {

// What a library writes to the system log meanwhile, which is its only way to say where it looks.
// Exceptions of the action are caught; their text is in failure.
struct tLogged {
    std::string log;
    std::string failure; // "": none
};

// The C library copies the system log to the standard error output on request, and that can be led
// into a file.
tLogged loggedDuring(const std::function<void()>& action)
{
    const tFile file(std::tmpfile());
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
    std::rewind(file.get());
    logged.log = readToEnd(file.get(), "the system log");
    return logged;
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

tFinding documentFinding(const tServoLibrary& library, const std::string& referenceType)
{
    tStillClock clock;
    tServoHost host(library, clock);
    tTuning tuning;
    tuning.referenceType = referenceType;
    const tLogged logged = loggedDuring([&] { tune(host, tuning); });
    const std::string file = fileIn(logged.log);
    const auto finding = [&](tFinding::tGrade grade, const std::string& text) {
        return tFinding{grade, "document", fmt::format("{}: {}", referenceType, text)};
    };
    if (file.empty()) return finding(tFinding::kFault, "the plug-in looks for none");
    if (!logged.failure.empty()) return finding(tFinding::kFault, file + ": " + logged.failure);
    if (logged.log.find("Unable") != std::string::npos)
        return finding(tFinding::kLook, file + " cannot be read: the built-in values stay");
    return finding(tFinding::kGood, file);
}

void addServo(tFindings& findings, const tServoLibrary& library)
{
    tStillClock clock;
    tServoHost host(library, clock);
    host.writeConfig(host.readConfig());
    findings.push_back({tFinding::kGood, "servo", "starts, and takes the document that it gives"});
    for (const char* const type : {"IEEE 802.1AS-2011 TAB", "IEEE 1588-2008 BC"})
        findings.push_back(documentFinding(library, type));
}

} // namespace

tFindings servoFindings(const std::string& libraryFile)
{
    constexpr size_t kBits = 8;
    tFindings findings;
    findings.push_back({tFinding::kGood, "words",
                        fmt::format("of {} bits, as the plug-in's must be; time_t of {} bits",
                                    kBits * sizeof(void*), kBits * sizeof(std::time_t))});
    const char* topic = "library";
    try {
        const tServoLibrary library(libraryFile);
        findings.push_back({tFinding::kGood, topic, library.path + ", with all nine functions"});
        topic = "servo";
        addServo(findings, library);
    } catch (const std::exception& failure) {
        findings.push_back({tFinding::kFault, topic, failure.what()});
    }
    return findings;
}

} // namespace dravikHost
