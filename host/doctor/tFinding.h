#pragma once

#include <string>
#include <vector>

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
