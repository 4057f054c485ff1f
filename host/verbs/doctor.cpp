#include "verbs/verbs.h"

#include "doctor/findings.h"
#include "servo/tServoLibrary.h"
#include "text/files.h"

#include <fmt/format.h>

#include <memory>
#include <stdexcept>

namespace dravikHost {

namespace {

struct tDoctor {
    std::vector<std::string> devices; // none: all
    std::string library;
};

void run(const tDoctor& options)
{
    constexpr const char* kGrades[] = {"ok", "look", "FAULT"};
    tOutputFile output("-");
    int faults = 0;
    for (const tFindings& findings :
         {servoFindings(tServoLibrary::find(options.library)), kernelClockFindings(),
          ptpClockFindings(options.devices), permissionFindings()}) {
        for (const tFinding& finding : findings) {
            output.write(fmt::format("{:<5} {:<14} {}\n", kGrades[finding.grade], finding.topic,
                                     finding.text));
            faults += finding.grade == tFinding::kFault ? 1 : 0;
        }
    }
    output.flush();
    if (faults > 0) throw std::runtime_error(fmt::format("faults found: {}", faults));
}

} // namespace

std::function<void()> addDoctor(tOptionSet& options)
{
    const auto doctor = std::make_shared<tDoctor>();
    options.texts("devices", "DEVICE", doctor->devices, "PTP clocks to look at; else all in /dev");
    options.library(doctor->library);
    return [doctor] { run(*doctor); };
}

} // namespace dravikHost
