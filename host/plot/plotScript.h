#pragma once

#include "traces/tRecording.h"

#include <string>

// A script for gnuplot, its data included, that draws a trace: phase error and ordered frequency
// over time, with the time that it was not locked shaded.
//   file  the picture that it writes, whose ending, .svg or .png, says what kind
std::string plotScript(const tRecording& recording, const std::string& file);

// Whether a picture of that name can be drawn.
bool isPictureName(const std::string& file);
