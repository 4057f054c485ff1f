#pragma once

#include <string>
#include <vector>

namespace dravikHost {

// One line of what was looked at.
struct tFinding {
    enum tGrade {
        kGood,
        kLook, // works, but perhaps not as wished
        kFault
    } grade;
    const char* topic;
    std::string text;
};
using tFindings = std::vector<tFinding>;

// The plug-in: whether it loads, works and finds its default documents.
tFindings servoFindings(const std::string& libraryFile);

// The machine's own clock, as the kernel keeps it. Only looks.
tFindings kernelClockFindings();

// PTP hardware clocks; all that there are if none is named. Only looks.
tFindings ptpClockFindings(std::vector<std::string> devices);

// What this process may do.
tFindings permissionFindings();

} // namespace dravikHost
