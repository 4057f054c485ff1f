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
    const bool allowed = hasCapability(CAP_SYS_TIME);
    return {{allowed ? tFinding::kGood : tFinding::kLook, "permission",
             allowed ? "CAP_SYS_TIME is there: CLOCK_REALTIME can be steered"
                     : "no CAP_SYS_TIME: CLOCK_REALTIME cannot be steered"}};
}
