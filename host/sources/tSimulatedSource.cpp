#include "sources/tSimulatedSource.h"

#include <cmath>
#include <utility>

namespace dravikHost {

namespace {

// Beside that of the oscillator's drift.
enum tCause : uint64_t { kDelayedCause = 2, kDelayCause, kMissingCause, kFlickerCause };

} // namespace

// One number decides whether the measurement is an outlier, and of which sign.
double measurementErrorNs(const tMeasurementModel& model, tNoise& noise)
{
    double sumNs = model.noiseNs * noise.normal();
    const double chance = noise.uniform();
    if (chance < model.outlierRate)
        sumNs += chance < model.outlierRate / 2 ? -model.outlierSizeNs : model.outlierSizeNs;
    return sumNs;
}

tSimulatedSource::tSimulatedSource(tSimulatedClock& clock, tScenario phases, tNoise& noise,
                                   uint64_t seed, tSimulatedClock* referenceClock)
    : clock(clock), referenceClock(referenceClock), scenario(std::move(phases)),
      now(scenario.front()), noise(noise), chances(seed, kDelayedCause), delays(seed, kDelayCause),
      misses(seed, kMissingCause), flicker(tNoise(seed, kFlickerCause)),
      elapsedNs(-now.measurement.intervalNs)
{}

// Numbers are drawn for a pair that does not come too, so that silence does not change the noise.
std::optional<tMoment> tSimulatedSource::next()
{
    const int64_t intervalNs = now.measurement.intervalNs;
    if (elapsedNs + intervalNs >= now.measurement.durationNs) return std::nullopt;
    elapsedNs += intervalNs;
    if (elapsedNs > 0) clock.advance(intervalNs);
    enterPhases();
    const tPair pair = measure();
    return tMoment{elapsedNs, comes() ? std::optional(pair) : std::nullopt};
}

void tSimulatedSource::enterPhases()
{
    for (; entered < scenario.size() && scenario[entered].fromNs <= elapsedNs; ++entered) {
        now = scenario[entered];
        clock.become(now.oscillator);
        clock.changeFrequency(now.frequencyPpb);
        clock.step(now.stepNs);
        jumpedNs += now.jumpNs;
    }
}

tPair tSimulatedSource::measure()
{
    const tMeasurementModel& model = now.measurement;
    const auto cut = [&model](uint64_t ns) { return ns - ns % model.granularityNs; };
    const uint64_t trueNs = kStartNs + static_cast<uint64_t>(elapsedNs + jumpedNs);
    const double errorNs = std::floor(measurementErrorNs(model, noise) +
                                      flicker.withTime(model.flickerNs) - delayNs());
    const uint64_t referenceNs = referenceClock != nullptr ? referenceClock->timeNs() : trueNs;
    const uint64_t seenNs = referenceNs + static_cast<uint64_t>(static_cast<int64_t>(errorNs));
    return tPair{elapsedNs, cut(seenNs), cut(clock.timeNs()), clock.aheadOfNs(trueNs)};
}

// The reference is seen late, so the clock seems ahead.
double tSimulatedSource::delayNs()
{
    const tMeasurementModel& model = now.measurement;
    const double delayNs = model.delayNs * delays.exponential();
    return chances.uniform() < model.delayedRate ? delayNs + model.outlierSizeNs : delayNs;
}

bool tSimulatedSource::comes()
{
    return misses.uniform() >= now.measurement.missingRate && !now.silent;
}

} // namespace dravikHost
