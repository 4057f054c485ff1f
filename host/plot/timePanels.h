#pragma once

#include "traces/tRecording.h"

#include <string>
#include <vector>

namespace dravikHost {

// Text in quotes, as gnuplot reads it verbatim.
std::string quoted(const std::string& text);

// What gnuplot is given for a pair, by column: 1, when, in the unit of the time axis; 2, the error
// in ns; 3, the ordered frequency in ppb; 4, whether it was not locked.
std::string pairsBlock(const std::vector<tRecordedPair>& pairs);

// The phase error over time, and what was ordered. An axis leaves out how the clock started, if
// the rest would be lost in it, and says so.
std::string phasePanel(const tRecording& recording);
std::string frequencyPanel(const std::vector<tRecordedPair>& pairs);

} // namespace dravikHost
