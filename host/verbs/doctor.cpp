#include "verbs/doctor.h"

#include "doctor/findings.h"
#include "servo/tServoLibrary.h"
#include "text/tOutputFile.h"

#include <fmt/format.h>

#include <memory>
#include <stdexcept>

namespace {

struct tOptions {
    std::vector<std::string> devices; // none: all
    std::string library;
};

void doctor(const tOptions& options)
{
    constexpr const char* kGrades[] = {"ok", "look", "FAULT"};
    tOutputFile output(stdout, "the standard output");
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

tVerb addDoctor(CLI::App& app)
{
    CLI::App* const verb =
        app.add_subcommand("doctor", "Look at the plug-in and at the clocks of this machine");
    const auto options = std::make_shared<tOptions>();
    verb->add_option("devices", options->devices, "PTP clocks to look at; else all in /dev")
        ->type_name("DEVICE");
    addLibraryOption(*verb, options->library);
    return {verb, [options] { doctor(*options); }};
}
