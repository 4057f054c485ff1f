#pragma once

#include "sources/iPairSource.h"

#include <cstdint>

namespace dravikHost {

// Errors and frequencies over a stretch of a run: its figures are of one pair at least.
class tRunningFigures
{
public:
    void add(const tPair& pair, double orderedPpb);

    int64_t count() const { return pairs; }
    double rmsNs() const;
    double peakNs() const { return peak; }
    double meanPpb() const;
    double deviationPpb() const;

private:
    int64_t pairs = 0;
    double squares = 0;
    double peak = 0;
    double firstPpb = 0; // the others are summed as differences from it, which keeps their digits
    double sum = 0;
    double sumOfSquares = 0;
};

} // namespace dravikHost
