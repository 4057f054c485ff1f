#pragma once

#include <optional>
#include <vector>

namespace dravikHost {

// A phase error, evenly spaced.
struct tSeries {
    double interval = 0;       // s
    std::vector<double> phase; // s
};

// The phase of a frequency, a fraction for each interval: one point more.
tSeries phaseOf(const tSeries& frequency);

// Without the straight line from the first point to the last.
tSeries withoutSlope(const tSeries& series);

// Through a first-order filter of that corner, in Hz. It starts settled on the mean of the first
// second, so that no single point is taken for what was before.
tSeries lowPass(const tSeries& series, double corner);

// What that takes away.
tSeries highPass(const tSeries& series, double corner);

// How stable a phase is over tau, n intervals. Nothing if the series is too short for it.
struct tStability {
    std::optional<double> adev;  // Allan deviation; a fraction, as the next two
    std::optional<double> oadev; // from all overlapping stretches
    std::optional<double> mdev;  // modified: of averages
    std::optional<double> tdev;  // of time; s
    std::optional<double> mtie;  // largest peak-to-peak within tau; s
};

tStability stabilityAt(const tSeries& series, size_t n);

// The largest n for which there is an Allan deviation; 0 if there is none.
size_t largestAveraging(const tSeries& series);

// 1, 2, 4 ... as far as the series allows.
std::vector<size_t> octaves(const tSeries& series);

} // namespace dravikHost
