#pragma once

#include <string>

namespace dravikHost {

// The eleven parameters of a servo.
struct tServoParameters {
    double frequencyLockGain = 1;
    double phaseLockGain = 0;
    double phaseLockCoefficientA = 0;
    double phaseLockCoefficientB = 0;
    double phaseLockCoefficientC = 1;
    double snapTimeThreshold = 0; // s
    int spikeFilterEnabled = 0;
    int spikeFilterHistorySize = 0;
    double spikeFilterMaxThreshold = 0; // s/s
    double spikeFilterMinThreshold = 0; // s/s
    double spikeFilterGrowthFactor = 0;

    // A document with all of them, six digits each, a line for each key.
    std::string documentText() const;

    // Of a document with all eleven keys, as the plug-in gives it out. Throws std::runtime_error.
    static tServoParameters of(const std::string& document);
};

} // namespace dravikHost
