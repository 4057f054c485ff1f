#include "clocks/tSteeredClock.h"
#include "doctor/findings.h"
#include "servo/defaultDocument.h"

#include <fmt/format.h>

#include <ctime>
#include <exception>
#include <string>

namespace dravikHost {

namespace {

tFinding documentFinding(const tServoLibrary& library, const std::string& referenceType)
{
    tStillClock clock;
    tServoHost host(library, clock);
    const tDefaultDocument document = applyAndListen(host, metaDataOf(referenceType));
    const std::string& file = document.file;
    const auto finding = [&](tFinding::tGrade grade, const std::string& text) {
        return tFinding{grade, "document", fmt::format("{}: {}", referenceType, text)};
    };
    if (!document.isLogged) return finding(tFinding::kFault, "the system log cannot be caught");
    if (file.empty()) return finding(tFinding::kFault, "the plug-in looks for none");
    if (!document.failure.empty()) return finding(tFinding::kFault, file + ": " + document.failure);
    if (document.unreadable)
        return finding(tFinding::kLook, file + " cannot be read: the built-in values stay");
    return finding(tFinding::kGood, file);
}

void addServo(tFindings& findings, const tServoLibrary& library)
{
    tStillClock clock;
    tServoHost host(library, clock);
    host.writeConfig(host.readConfig());
    findings.push_back({tFinding::kGood, "servo", "starts, and takes the document that it gives"});
    for (const std::string& type : typesWithDocument())
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
