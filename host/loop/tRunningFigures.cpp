#include "loop/tRunningFigures.h"

#include <algorithm>
#include <cmath>

namespace dravikHost {

void tRunningFigures::add(const tPair& pair, double orderedPpb)
{
    if (pairs++ == 0) firstPpb = orderedPpb;
    const auto errorNs = static_cast<double>(pair.errorNs());
    squares += errorNs * errorNs;
    peak = std::max(peak, std::fabs(errorNs));
    const double difference = orderedPpb - firstPpb;
    sum += difference;
    sumOfSquares += difference * difference;
}

double tRunningFigures::rmsNs() const { return std::sqrt(squares / static_cast<double>(pairs)); }

double tRunningFigures::meanPpb() const { return firstPpb + sum / static_cast<double>(pairs); }

double tRunningFigures::deviationPpb() const
{
    const double mean = sum / static_cast<double>(pairs);
    return std::sqrt(std::max(0.0, sumOfSquares / static_cast<double>(pairs) - mean * mean));
}

} // namespace dravikHost
