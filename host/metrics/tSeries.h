#pragma once

#include <vector>

// A phase error, evenly spaced.
struct tSeries {
    double interval = 0;       // s
    std::vector<double> phase; // s
};

// The phase of a frequency, a fraction for each interval: one point more.
tSeries phaseOf(const tSeries& frequency);

// Without the straight line from the first point to the last.
tSeries withoutSlope(const tSeries& series);

// Through a first-order filter of that corner, in Hz, that starts at the first point.
tSeries lowPass(const tSeries& series, double corner);

// What that takes away.
tSeries highPass(const tSeries& series, double corner);
