#include "design/tTrial.h"

#include "clocks/tSteeredClock.h"
#include "loop/tMeasureSpacing.h"
#include "servo/tFineServo.h"
#include "sources/tSimulatedSource.h"

#include <algorithm>
#include <cmath>
#include <memory>
#include <vector>

namespace dravikHost {

namespace {

constexpr int32_t kMaxOffsetPpb = 500'000;
constexpr uint64_t kFirstSeed = 1000;

tOscillatorModel oscillatorOf(const tNoiseModel& model, double errorPpb)
{
    return {errorPpb, model.frequencyNoisePpb, model.wanderPpb};
}

tMeasurementModel measurementOf(const tNoiseModel& model)
{
    tMeasurementModel measurement;
    measurement.noiseNs = model.noiseNs;
    measurement.outlierRate = model.outlierRate;
    measurement.outlierSizeNs = model.outlierSizeNs;
    measurement.granularityNs = static_cast<uint64_t>(model.granularityNs);
    return measurement;
}

struct tFirstPairs {
    bool noisy = false;
    uint64_t offsetNs = 0; // of the clock
    int64_t measureOverNs = 0;
};

class tRun
{
public:
    tRun(const tServoLibrary& library, const tServoParameters& parameters, const tNoiseModel& model,
         uint64_t seed, const tFirstPairs& first = {})
        : intervalNs(model.intervalNs), measurement(measurementOf(model)), noise(seed),
          clock(tSimulatedSource::kStartNs + first.offsetNs,
                oscillatorOf(model, first.noisy ? kFrequencyPpb + noise.uniform() : 0),
                kMaxOffsetPpb, noise),
          servo(library, clock, usualFactor(parameters.snapTimeThreshold), parameters),
          spacing(first.measureOverNs), noisy(first.noisy)
    {}

    // Measures against the clock before, else against the true time. Returns the true error, in ns.
    double takePair(tRun* before = nullptr)
    {
        clock.advance(intervalNs);
        trueNs += static_cast<uint64_t>(intervalNs);
        const double errorNs = clock.aheadOfNs(trueNs);
        const double seenNs = noisy ? measurementErrorNs(measurement, noise) : 0;
        elapsedNs += intervalNs;
        if (spacing.holdsBack(elapsedNs)) return errorNs;
        const auto errorSeenNs = static_cast<int64_t>(std::floor(seenNs));
        const uint64_t referenceNs = before != nullptr ? before->clock.timeNs() : trueNs;
        const tLockEvent event = servo.adjustTime(
            cut(referenceNs + static_cast<uint64_t>(errorSeenNs)), cut(clock.timeNs()));
        spacing.given(elapsedNs, event, servo.measuring());
        lost += event == kLockLost ? 1 : 0;
        missed = missed || event == kLockMissed;
        wasLocked = wasLocked || servo.locked();
        noisy = noisy || wasLocked;
        return errorNs;
    }

    int64_t locksLost() const { return lost; }
    bool failed() const { return lost > 0 || missed; }
    bool everLocked() const { return wasLocked; }

private:
    static constexpr double kFrequencyPpb = 12'000; // and a fraction, of a clock to be measured

    uint64_t cut(uint64_t ns) const { return noisy ? ns - ns % measurement.granularityNs : ns; }

    int64_t intervalNs;
    tMeasurementModel measurement;
    tNoise noise;
    tSimulatedClock clock;
    tFineServo servo;
    tMeasureSpacing spacing;
    bool noisy; // the measurements
    bool wasLocked = false;
    int64_t lost = 0;
    bool missed = false;
    int64_t elapsedNs = 0;
    uint64_t trueNs = tSimulatedSource::kStartNs;
};

// Clocks in a row, each with noise of its own.
class tRow
{
public:
    tRow(const tServoLibrary& library, const tServoParameters& parameters, const tNoiseModel& model,
         uint64_t seed)
    {
        constexpr int kSeedBits = 32;
        for (int hop = 0; hop < model.hops; ++hop) {
            const uint64_t seedOfHop = seed + (static_cast<uint64_t>(hop) << kSeedBits);
            runs.push_back(std::make_unique<tRun>(library, parameters, model, seedOfHop));
        }
    }

    // Returns the true error of the last one, in ns.
    double takePair()
    {
        tRun* before = nullptr;
        double errorNs = 0;
        for (const auto& run : runs) {
            errorNs = run->takePair(before);
            before = run.get();
        }
        return errorNs;
    }

    int64_t locksLost() const { return runs.back()->locksLost(); }

private:
    std::vector<std::unique_ptr<tRun>> runs;
};

} // namespace

int usualFactor(double snapTimeThreshold)
{
    return tFineServo::factorFor(tFineServo::kFinest, kMaxOffsetPpb, snapTimeThreshold);
}

tTrialResult runTrial(const tServoLibrary& library, const std::string& document,
                      const tNoiseModel& model, const tTrialOptions& options)
{
    const tServoParameters parameters = tServoParameters::of(document);
    tTrialResult result{};
    double squares = 0;
    double eighths = 0;
    int64_t lost = 0;
    for (uint64_t i = 0; i < options.seeds; ++i) {
        tRow run(library, parameters, model, kFirstSeed + i);
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

tStartResult runStarts(const tServoLibrary& library, const std::string& document,
                       const tNoiseModel& model, const tStartOptions& options)
{
    constexpr uint64_t kOffsetNs = 1'000'000;
    const tServoParameters parameters = tServoParameters::of(document);
    tStartResult result{};
    double squares = 0;
    const int64_t half = options.pairs / 2;
    for (uint64_t i = 0; i < options.starts; ++i) {
        tRun run(library, parameters, model, kFirstSeed + i,
                 {true, kOffsetNs, options.measureOverNs});
        for (int64_t pair = 0; pair < half; ++pair)
            run.takePair();
        const int64_t early = run.locksLost();
        result.failed += run.failed() ? 1 : 0;
        for (int64_t pair = 0; pair < half; ++pair) {
            const double errorNs = run.takePair();
            squares += errorNs * errorNs;
        }
        result.neverLocked += run.everLocked() ? 0 : 1;
        result.lostEarly += early;
        result.lostLate += run.locksLost() - early;
    }
    const auto counted = static_cast<double>(half) * static_cast<double>(options.starts);
    result.rmsNs = std::sqrt(squares / counted);
    return result;
}

tTrialOptions trialFor(const tLoopGains& gains, const tNoiseModel& model)
{
    const double timeConstant = 1 / std::sqrt(gains.ki * model.interval()); // in pairs
    const auto settling =
        static_cast<int64_t>(std::clamp(10 * timeConstant * model.hops, 50.0, 2000.0));
    const auto counted = static_cast<int64_t>(std::clamp(200 * timeConstant, 2000.0, 10000.0));
    return {settling, counted, static_cast<uint64_t>(std::max(32 / model.hops, 4))};
}

} // namespace dravikHost
