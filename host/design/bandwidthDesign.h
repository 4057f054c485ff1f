#pragma once

#include "servo/tLoopGains.h"

namespace dravikHost {

// The loop whose gain from the reference to the clock is down by 3 dB at a bandwidth, in Hz, and
// nowhere more than the peaking above 1, in dB. Of those that with the quickest integral part,
// though none with a damping below 0.7. The interval is in seconds. Throws std::runtime_error if no
// loop has it.
tLoopGains gainsForBandwidth(double bandwidth, double peaking, double interval);

} // namespace dravikHost
