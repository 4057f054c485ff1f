#pragma once

#include "metrics/stability.h"
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

// Where panels are: fractions of the picture's height.
struct tPanelRow {
    double bottom;
    double height;
};

// Whether there is anything to draw: logarithmic axes have no zero.
bool hasStability(const tSeries& series);

// The stability curves of a phase error for gnuplot, data included: TDEV and MTIE, with the limits
// of a mask unless that is "", and ADEV and MDEV beside them. Throws std::runtime_error if the
// series is not made for the mask.
std::string stabilityPanels(const tSeries& series, const std::string& mask, const tPanelRow& row);

// Hands a script to gnuplot and waits for it. Throws std::runtime_error if it cannot be started or
// does not succeed.
void runGnuplot(const std::string& script);

} // namespace dravikHost
