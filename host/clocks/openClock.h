#pragma once

#include "clocks/iClock.h"

#include <memory>
#include <string>

namespace dravikHost {

// Which clock is disciplined: "soft", "phc:DEVICE" or "realtime".
struct tClockChoice {
    std::string name = "soft";
    int32_t limitPpb = 0;      // the widest offset of its rate that is wanted
    int64_t startOffsetNs = 0; // how wrong the soft clock starts
    double startFrequencyPpb = 0;
    bool isToBeSet = true; // or only read, in a dry run
};

bool isClockName(const std::string& name);

// Throws std::system_error that names what cannot be opened, or not be set.
std::unique_ptr<iLiveClock> openClock(const tClockChoice& choice);

} // namespace dravikHost
