#include "design/tTrial.h"

#include "clocks/tSteeredClock.h"
#include "servo/tLockObserver.h"
#include "servo/tServoHost.h"
#include "sources/tSimulatedSource.h"

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

constexpr int32_t kMaxOffsetPpb = 500'000;
constexpr uint64_t kFirstSeed = 1000;

tOscillatorModel oscillatorOf(const tNoiseModel& model)
{
    return {0, model.frequencyNoisePpb, model.wanderPpb};
}

tMeasurementModel measurementOf(const tNoiseModel& model)
{
    tMeasurementModel measurement;
    measurement.noiseNs = model.noiseNs;
    measurement.outlierRate = model.outlierRate;
    measurement.outlierSizeNs = model.outlierSizeNs;
    return measurement;
}

class tRun
{
public:
    tRun(const tServoLibrary& library, const std::string& document, const tNoiseModel& model,
         uint64_t seed)
        : intervalNs(model.intervalNs), measurement(measurementOf(model)), noise(seed),
          clock(tSimulatedSource::kStartNs, oscillatorOf(model), kMaxOffsetPpb, noise),
          host(library, clock), observer(-kMaxOffsetPpb, kMaxOffsetPpb)
    {
        host.writeConfig(document);
    }

    // Returns the true error, in ns.
    double takePair()
    {
        clock.advance(intervalNs);
        trueNs += static_cast<uint64_t>(intervalNs);
        const double errorNs = clock.aheadOfNs(trueNs);
        const double seenNs = acquired ? measurementErrorNs(measurement, noise) : 0;
        host.adjustTime(trueNs + static_cast<uint64_t>(static_cast<int64_t>(std::floor(seenNs))),
                        clock.timeNs());
        lost += observer.observe(host.calls()) == kLockLost ? 1 : 0;
        acquired = acquired || observer.locked();
        return errorNs;
    }

    int64_t locksLost() const { return lost; }

private:
    int64_t intervalNs;
    tMeasurementModel measurement;
    tNoise noise;
    tSimulatedClock clock;
    tServoHost host;
    tLockObserver observer;
    bool acquired = false; // the first lock
    int64_t lost = 0;
    uint64_t trueNs = tSimulatedSource::kStartNs;
};

} // namespace

tTrialResult runTrial(const tServoLibrary& library, const std::string& document,
                      const tNoiseModel& model, const tTrialOptions& options)
{
    tTrialResult result;
    double squares = 0;
    double eighths = 0;
    int64_t lost = 0;
    for (uint64_t i = 0; i < options.seeds; ++i) {
        tRun run(library, document, model, kFirstSeed + i);
        for (int64_t pair = 0; pair < options.settlingPairs; ++pair)
            run.takePair();
        for (int64_t pair = 0; pair < options.countedPairs; ++pair) {
            const double errorNs = run.takePair();
            const double square = errorNs * errorNs;
            squares += square;
            eighths += square * square * square * square;
            result.peakNs = std::max(result.peakNs, std::fabs(errorNs));
        }
        lost += run.locksLost();
    }
    const auto seeds = static_cast<double>(options.seeds);
    const auto counted = static_cast<double>(options.countedPairs);
    const auto all = static_cast<double>(options.settlingPairs) + counted;
    result.tailNs = std::pow(eighths / (counted * seeds), 0.125);
    result.rmsNs = std::sqrt(squares / (counted * seeds));
    result.lostPerHour = static_cast<double>(lost) * 3600 / (all * seeds * model.interval());
    return result;
}

tTrialOptions trialFor(const tLoopGains& gains, const tNoiseModel& model)
{
    const double timeConstant = 1 / std::sqrt(gains.ki * model.interval()); // in pairs
    const auto settling = static_cast<int64_t>(std::clamp(10 * timeConstant, 50.0, 2000.0));
    const auto counted = static_cast<int64_t>(std::clamp(200 * timeConstant, 2000.0, 10000.0));
    return {settling, counted, 32};
}

} // namespace dravikHost
