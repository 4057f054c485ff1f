#pragma once

#include "servo/tServoLibrary.h"
#include "servo/tServoParameters.h"

#include <optional>
#include <string>

namespace dravikHost {

// For people: what a document amounts to at an interval of so many seconds, and what will go wrong
// with it. Lines that begin with "!" are warnings. With white noise of that deviation of the
// measurements the threshold and the spike filter are judged too.
std::string loopAdvice(const tServoLibrary& library, const tServoParameters& parameters,
                       double interval, std::optional<double> noiseNs);

} // namespace dravikHost
