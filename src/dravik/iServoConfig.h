#pragma once

#include "dravik/arithmetic.h"

#include <cstdint>
#include <string>

namespace zvckmDravik {

// The tuning parameters as the states and the spike filter read them, and as configuration text
// sets them. A setter checks its value (bounds in zvckmservo/parameters.h) and touches nothing but
// its own parameter; a value is used from the next time that it is read. The two frequency limits
// come from the host at construction and cannot be set.
//
// Each getter and setter takes the servo's lock. A refused value raises zvplaterr_invalidParameter
// and leaves the parameter as it was. The order of the operations is fixed.
class iServoConfig
{
public:
    virtual ~iServoConfig() = default;

    virtual double getFrequencyLockGain() const = 0;     // factor on the measured rate
    virtual double getPhaseLockGain() const = 0;         // g of the phase lock law
    virtual double getPhaseLockCoefficientA() const = 0; // weight of the present error
    virtual double getPhaseLockCoefficientB() const = 0; // weight of the previous error, subtracted
    virtual double getPhaseLockCoefficientC() const = 0; // weight of the previous frequency offset
    virtual double getSnapTimeThreshold() const = 0;     // seconds
    virtual double getMaxFrequencyOffset() const = 0;    // fraction of nominal rate
    virtual double getMinFrequencyOffset() const = 0;    // fraction of nominal rate

    virtual bool getSpikeFilterEnabled() const = 0;
    virtual uint32_t getSpikeFilterHistorySize() const = 0; // number of rates

    virtual double getSpikeFilterMaxThreshold() const = 0; // seconds per second
    virtual double getSpikeFilterMinThreshold() const = 0; // seconds per second
    virtual double getSpikeFilterGrowthFactor() const = 0; // threshold over mean rate

    virtual void setFrequencyLockGain(double value) = 0;
    virtual void setPhaseLockGain(double value) = 0;
    virtual void setPhaseLockCoefficientA(double value) = 0;
    virtual void setPhaseLockCoefficientB(double value) = 0;
    virtual void setPhaseLockCoefficientC(double value) = 0;
    virtual void setSnapTimeThreshold(double value) = 0;

    virtual void setSpikeFilterEnabled(bool value) = 0;
    virtual void setSpikeFilterHistorySize(uint32_t value) = 0;

    virtual void setSpikeFilterMaxThreshold(double value) = 0;
    virtual void setSpikeFilterMinThreshold(double value) = 0;
    virtual void setSpikeFilterGrowthFactor(double value) = 0;

    // The whole configuration as one JSON text.
    virtual std::string readServoConfigJson() = 0;
    virtual void writeServoConfigJson(const std::string& json) = 0;
};

} // namespace zvckmDravik
