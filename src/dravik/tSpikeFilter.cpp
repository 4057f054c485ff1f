#include "dravik/tSpikeFilter.h"

#include "dravik/clamp.h"

#include <cmath>

namespace zvckmDravik {

namespace {

// Holds for the first lock of a servo whatever is configured: only leaving a lock resets to the
// configured ceiling.
constexpr double kFirstThreshold = 1.0;

} // namespace

tSpikeFilter::tSpikeFilter(iServoConfig& config)
    : config(config), historySum(0.0), lastOffset(0.0), threshold(kFirstThreshold)
{}

void tSpikeFilter::reset()
{
    history.clear();
    historySum = 0.0;
    lastOffset = 0.0;
    threshold = config.getSpikeFilterMaxThreshold();
}

double tSpikeFilter::filter(double offset, double elapsed)
{
    if (!config.getSpikeFilterEnabled()) return offset;
    if (elapsed <= 0) { // nothing to measure a rate against
        lastOffset = offset;
        return offset;
    }

    const double rate = (offset - lastOffset) / elapsed;
    double magnitude = std::fabs(rate);
    if (magnitude > threshold) {
        const double limited = threshold * (rate < 0 ? -1.0 : +1.0);
        offset = lastOffset + limited * elapsed;
        magnitude = std::fabs(limited); // the history learns the limit, not the size of the spike
    }
    lastOffset = offset;
    remember(magnitude);
    threshold = nextThreshold(); // judges the next pair; this one was judged by the old one
    return offset;
}

void tSpikeFilter::remember(double magnitude)
{
    // The size may have been lowered since the last pair: all surplus leaves here at once.
    while (config.getSpikeFilterHistorySize() <= history.size()) {
        historySum -= history.front();
        history.erase(history.begin());
    }
    history.push_back(magnitude); // may raise, so before the sum that must agree with it
    historySum += magnitude;
}

double tSpikeFilter::nextThreshold() const
{
    const double mean = historySum / static_cast<double>(history.size());
    const double candidate = config.getSpikeFilterGrowthFactor() * mean;
    return clampMaximumFirst(candidate, config.getSpikeFilterMaxThreshold(),
                             config.getSpikeFilterMinThreshold());
}

} // namespace zvckmDravik
