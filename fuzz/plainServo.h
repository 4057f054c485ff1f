#pragma once

#include "tScriptedClock.h"

#include <array>
#include <cmath>
#include <cstdint>
#include <deque>
#include <string>

// The servo once more, as plainly as it can be said: no lock, no classes for states, one function
// for a pair. What the fuzzer compares the plug-in with, so it shares no code with it.
struct tPlainServo {
    explicit tPlainServo(tScriptedClock& clock)
        : clock(clock), max(clock.getMaxFrequencyOffset() * 1e-9),
          min(clock.getMinFrequencyOffset() * 1e-9)
    {}

    // The parameters in the order of a document.
    enum { kFrequencyGain, kGain, kA, kB, kC, kSnap, kFilter, kHistory, kCeiling, kFloor, kGrowth };
    struct tBounds {
        const char* key;
        double lowest, highest;
    };
    static constexpr std::array<tBounds, 11> kBounds = {{{"frequencyLockGain", 1e-9, 10},
                                                         {"phaseLockGain", 1e-9, 10},
                                                         {"phaseLockCoefficientA", -10, 10},
                                                         {"phaseLockCoefficientB", -10, 10},
                                                         {"phaseLockCoefficientC", -10, 10},
                                                         {"snapTimeThreshold", 1e-8, 10},
                                                         {"spikeFilterEnabled", 0, 1},
                                                         {"spikeFilterHistorySize", 2, 100},
                                                         {"spikeFilterMaxThreshold", 1e-9, 10},
                                                         {"spikeFilterMinThreshold", 1e-9, 10},
                                                         {"spikeFilterGrowthFactor", 1.001, 100}}};
    std::array<double, 11> values = {1, 0.55, 2, 1, 1, 1e-6, 0, 5, 1, 2.5e-8, 3};

    // False for a value that is refused. A flag and a size are cut to an integer first.
    bool set(size_t index, double value)
    {
        if (index == kHistory) value = std::trunc(value);
        if (index == kFilter) value = std::trunc(value) == 1 ? 1 : 0;
        if (!(value >= kBounds[index].lowest && value <= kBounds[index].highest)) return false;
        values[index] = value;
        return true;
    }

    std::string document() const
    {
        std::string text = "{\n";
        for (size_t i = 0; i < values.size(); ++i) {
            char number[64];
            (void)std::snprintf(number, sizeof number, "%1.15g", values[i]);
            if (std::strtod(number, nullptr) != values[i]) {
                (void)std::snprintf(number, sizeof number, "%1.17g", values[i]);
            }
            text += std::string("\t\"") + kBounds[i].key + "\":\t" + number;
            text += i + 1 < values.size() ? ",\n" : "\n}";
        }
        return text;
    }

    void startOver()
    {
        if (state == kPhaseLock) leaveLock();
        hasFirst = false;
        state = kFrequencyLock;
    }

    // May divide by zero, and goes on with what comes of it.
    __attribute__((no_sanitize("float-divide-by-zero"))) void pair(uint64_t reference,
                                                                   uint64_t local)
    {
        if (state == kFrequencyLock) {
            if (!hasFirst) {
                hasFirst = true;
                firstReference = reference;
                firstLocal = local;
                return;
            }
            const double rate = seconds(reference, firstReference) / seconds(local, firstLocal);
            const double ratio = frequency() * (rate * values[kFrequencyGain]);
            const double offset = ratio - 1.0;
            if (offset <= max && offset >= min) {
                order(ratio);
                hasFirst = false;
                state = kSnapTime;
            } else {
                hasFirst = false;
                order(clamped(offset, min, max) + 1.0);
            }
        } else if (state == kSnapTime) {
            const auto delta = static_cast<int64_t>(reference - local);
            const uint64_t magnitude = delta < 0 ? 0 - static_cast<uint64_t>(delta) : delta;
            const double whole = std::floor(values[kSnap]);
            const auto thresholdNs = static_cast<uint64_t>(whole) * 1000000000U +
                                     static_cast<uint64_t>((values[kSnap] - whole) * 1e9);
            if (magnitude >= thresholdNs) clock.stepTime(delta);
            state = kPhaseLock;
        } else {
            const double ahead = seconds(local, reference);
            if (std::fabs(ahead) >= values[kSnap]) {
                leaveLock();
                state = kFrequencyLock;
                return;
            }
            const double elapsed = hasLast ? seconds(reference, lastReference) : 0.0;
            hasLast = true;
            lastReference = reference;
            const double error = -filtered(ahead, elapsed);
            const double present = frequency() - 1.0;
            const double past = (values[kGain] * values[kB]) * lastError;
            const double offset =
                (values[kGain] * values[kA]) * error - past + present * values[kC];
            order(clamped(offset, min, max) + 1.0);
            lastError = error;
        }
    }

    enum { kFrequencyLock, kSnapTime, kPhaseLock } state = kFrequencyLock;

private:
    static double seconds(uint64_t later, uint64_t earlier)
    {
        const auto difference = static_cast<int64_t>(later - earlier);
        return difference < 0 ? -(static_cast<double>(earlier - later) / 1e9)
                              : static_cast<double>(later - earlier) / 1e9;
    }

    // What is not a number stays so.
    static double clamped(double value, double low, double high)
    {
        if (value > high) return high;
        return value < low ? low : value;
    }

    double frequency() { return 1.0 + clock.getFrequency() * 1e-9; }

    void order(double ratio)
    {
        const double ppb = (ratio - 1.0) * 1e9;
        const double rounded = std::trunc(ppb >= 0 ? ppb + 0.5 : ppb - 0.5);
        clock.setFrequency(std::isnan(rounded) ? 0
                                               : static_cast<int32_t>(clamped(
                                                     rounded, -2147483648.0, 2147483647.0)));
    }

    double filtered(double offset, double elapsed)
    {
        if (values[kFilter] == 0) return offset;
        if (elapsed <= 0) return lastOffset = offset;
        const double rate = (offset - lastOffset) / elapsed;
        double size = std::fabs(rate);
        if (size > threshold) {
            size = threshold;
            offset = lastOffset + (rate < 0 ? -threshold : threshold) * elapsed;
        }
        lastOffset = offset;
        while (static_cast<double>(history.size()) >= values[kHistory]) {
            sum -= history.front();
            history.pop_front();
        }
        sum += size;
        history.push_back(size);
        const double mean = sum / static_cast<double>(history.size());
        threshold = clamped(values[kGrowth] * mean, values[kFloor], values[kCeiling]);
        return offset;
    }

    void leaveLock()
    {
        hasLast = false;
        lastError = 0;
        history.clear();
        sum = 0;
        lastOffset = 0;
        threshold = values[kCeiling];
    }

    tScriptedClock& clock;
    double max, min;
    bool hasFirst = false, hasLast = false;
    uint64_t firstReference = 0, firstLocal = 0, lastReference = 0;
    double lastError = 0, lastOffset = 0, sum = 0, threshold = 1;
    std::deque<double> history;
};
