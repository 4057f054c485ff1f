#pragma once

#include "traces/tRecording.h"

#include <string>

namespace dravikHost {

struct tPlotOptions {
    std::string picture; // the file that gnuplot writes; its ending, .svg or .png, says what kind
    std::string mask;    // beside the stability curves; "": none
};

// A script for gnuplot, its data included, that draws a trace: phase error and ordered frequency
// over time, with the time that it was not locked shaded, and how stable it is once locked. Throws
// std::runtime_error if the trace is not made for the mask.
std::string plotScript(const tRecording& recording, const tPlotOptions& options);

// Whether a picture of that name can be drawn.
bool isPictureName(const std::string& file);

} // namespace dravikHost
