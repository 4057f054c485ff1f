#include "sources/tSimulatedSource.h"

#include <cmath>

namespace dravikHost {

// One number decides whether the measurement is an outlier, and of which sign.
double measurementErrorNs(const tMeasurementModel& model, tNoise& noise)
{
    double sumNs = model.noiseNs * noise.normal();
    const double chance = noise.uniform();
    if (chance < model.outlierRate)
        sumNs += chance < model.outlierRate / 2 ? -model.outlierSizeNs : model.outlierSizeNs;
    return sumNs;
}

tSimulatedSource::tSimulatedSource(tSimulatedClock& clock, const tMeasurementModel& model,
                                   tNoise& noise)
    : clock(clock), model(model), noise(noise), elapsedNs(-model.intervalNs)
{}

std::optional<tPair> tSimulatedSource::next()
{
    if (elapsedNs + model.intervalNs >= model.durationNs) return std::nullopt;
    elapsedNs += model.intervalNs;
    if (elapsedNs > 0) clock.advance(model.intervalNs);

    const auto cut = [this](uint64_t ns) { return ns - ns % model.granularityNs; };
    const uint64_t trueNs = kStartNs + static_cast<uint64_t>(elapsedNs);
    const double errorNs = std::floor(measurementErrorNs(model, noise));
    const uint64_t seenNs = trueNs + static_cast<uint64_t>(static_cast<int64_t>(errorNs));
    return tPair{elapsedNs, cut(seenNs), cut(clock.timeNs()), clock.aheadOfNs(trueNs)};
}

} // namespace dravikHost
