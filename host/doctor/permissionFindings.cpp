#include "doctor/findings.h"

#include <fstream>
#include <linux/capability.h>

namespace {

// Of the effective ones, which the kernel writes as one hexadecimal number.
bool hasCapability(unsigned number)
{
    std::ifstream status("/proc/self/status");
    std::string word;
    while (status >> word) {
        if (word != "CapEff:") continue;
        unsigned long long effective = 0;
        status >> std::hex >> effective;
        return (effective >> number & 1U) != 0;
    }
    return false;
}

} // namespace

tFindings permissionFindings()
{
    if (hasCapability(CAP_SYS_TIME))
        return {{tFinding::kGood, "permission", "CAP_SYS_TIME is there: clocks can be steered"}};
    return {{tFinding::kLook, "permission",
             "no CAP_SYS_TIME: the soft clock can be steered, no clock of the machine"}};
}
