#pragma once

#include "metrics/stability.h"

#include <string>

namespace dravikHost {

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

} // namespace dravikHost
