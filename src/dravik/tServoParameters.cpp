#include "dravik/tServo.h"
#include "zvckmservo/parameters.h"
#include "zverr/Exception.h"

// The eleven tuning parameters: each getter and setter under the lock for its one member, with the
// bounds, inclusive, tested before the lock is taken. No parameter is related to another one.

namespace zvckmDravik {

namespace {

// Refuses a value that is not a number too.
template <class T>
void check(T value, zvckmservo_ParameterIndex index, const zverr_RaisingSite& site)
{
    const zvckmservo_Parameter& bounds = zvckmservo_parameters[index];
    if (!(value >= static_cast<T>(bounds.lowest) && value <= static_cast<T>(bounds.highest))) {
        zverr::raise(site);
    }
}

} // namespace

template <class T> T tServo::read(const T& member) const
{
    mutex.lock();
    const T value = member;
    mutex.unlock();
    return value;
}

template <class T> void tServo::write(T& member, T value)
{
    mutex.lock();
    member = value;
    mutex.unlock();
}

double tServo::getFrequencyLockGain() const { return read(frequencyLockGain); }

double tServo::getPhaseLockGain() const { return read(phaseLockGain); }

double tServo::getPhaseLockCoefficientA() const { return read(phaseLockCoefficientA); }

double tServo::getPhaseLockCoefficientB() const { return read(phaseLockCoefficientB); }

double tServo::getPhaseLockCoefficientC() const { return read(phaseLockCoefficientC); }

double tServo::getSnapTimeThreshold() const { return read(snapTimeThreshold); }

double tServo::getMaxFrequencyOffset() const { return read(maxFrequencyOffset); }

double tServo::getMinFrequencyOffset() const { return read(minFrequencyOffset); }

bool tServo::getSpikeFilterEnabled() const { return read(spikeFilterEnabled); }

uint32_t tServo::getSpikeFilterHistorySize() const { return read(spikeFilterHistorySize); }

double tServo::getSpikeFilterMaxThreshold() const { return read(spikeFilterMaxThreshold); }

double tServo::getSpikeFilterMinThreshold() const { return read(spikeFilterMinThreshold); }

double tServo::getSpikeFilterGrowthFactor() const { return read(spikeFilterGrowthFactor); }

void tServo::setFrequencyLockGain(double value)
{
    check(value, zvckmservo_kFrequencyLockGain, zverr::kAtFrequencyLockGain);
    write(frequencyLockGain, value);
}

void tServo::setPhaseLockGain(double value)
{
    check(value, zvckmservo_kPhaseLockGain, zverr::kAtPhaseLockGain);
    write(phaseLockGain, value);
}

void tServo::setPhaseLockCoefficientA(double value)
{
    check(value, zvckmservo_kPhaseLockCoefficientA, zverr::kAtPhaseLockCoefficientA);
    write(phaseLockCoefficientA, value);
}

void tServo::setPhaseLockCoefficientB(double value)
{
    check(value, zvckmservo_kPhaseLockCoefficientB, zverr::kAtPhaseLockCoefficientB);
    write(phaseLockCoefficientB, value);
}

void tServo::setPhaseLockCoefficientC(double value)
{
    check(value, zvckmservo_kPhaseLockCoefficientC, zverr::kAtPhaseLockCoefficientC);
    write(phaseLockCoefficientC, value);
}

void tServo::setSnapTimeThreshold(double value)
{
    check(value, zvckmservo_kSnapTimeThreshold, zverr::kAtSnapTimeThreshold);
    write(snapTimeThreshold, value);
}

void tServo::setSpikeFilterEnabled(bool value) { write(spikeFilterEnabled, value); }

void tServo::setSpikeFilterHistorySize(uint32_t value)
{
    check(value, zvckmservo_kSpikeFilterHistorySize, zverr::kAtSpikeFilterHistorySize);
    write(spikeFilterHistorySize, value);
}

void tServo::setSpikeFilterMaxThreshold(double value)
{
    check(value, zvckmservo_kSpikeFilterMaxThreshold, zverr::kAtSpikeFilterMaxThreshold);
    write(spikeFilterMaxThreshold, value);
}

void tServo::setSpikeFilterMinThreshold(double value)
{
    check(value, zvckmservo_kSpikeFilterMinThreshold, zverr::kAtSpikeFilterMinThreshold);
    write(spikeFilterMinThreshold, value);
}

void tServo::setSpikeFilterGrowthFactor(double value)
{
    check(value, zvckmservo_kSpikeFilterGrowthFactor, zverr::kAtSpikeFilterGrowthFactor);
    write(spikeFilterGrowthFactor, value);
}

} // namespace zvckmDravik
