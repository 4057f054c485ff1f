#include "dravik/tServo.h"
#include "zverr/Exception.h"

// The eleven tuning parameters: each getter and setter under the lock for its one member, with the
// bounds, inclusive, tested before the lock is taken. No parameter is related to another one.

namespace zvckmDravik {

namespace {

template <class T> struct tBounds {
    T lowest;
    T highest;
};

constexpr tBounds<double> kGain{1e-9, 10.0};
constexpr tBounds<double> kCoefficient{-10.0, 10.0};
constexpr tBounds<double> kSnapTimeThreshold{1e-8, 10.0}; // seconds
constexpr tBounds<uint32_t> kHistorySize{2, 100};
constexpr tBounds<double> kThreshold{1e-9, 10.0}; // seconds per second
constexpr tBounds<double> kGrowthFactor{1.001, 100.0};

// Refuses a value that is not a number too.
template <class T> void check(T value, const tBounds<T>& bounds, const zverr_RaisingSite& site)
{
    if (!(value >= bounds.lowest && value <= bounds.highest)) zverr::raise(site);
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
    check(value, kGain, zverr::kAtFrequencyLockGain);
    write(frequencyLockGain, value);
}

void tServo::setPhaseLockGain(double value)
{
    check(value, kGain, zverr::kAtPhaseLockGain);
    write(phaseLockGain, value);
}

void tServo::setPhaseLockCoefficientA(double value)
{
    check(value, kCoefficient, zverr::kAtPhaseLockCoefficientA);
    write(phaseLockCoefficientA, value);
}

void tServo::setPhaseLockCoefficientB(double value)
{
    check(value, kCoefficient, zverr::kAtPhaseLockCoefficientB);
    write(phaseLockCoefficientB, value);
}

void tServo::setPhaseLockCoefficientC(double value)
{
    check(value, kCoefficient, zverr::kAtPhaseLockCoefficientC);
    write(phaseLockCoefficientC, value);
}

void tServo::setSnapTimeThreshold(double value)
{
    check(value, kSnapTimeThreshold, zverr::kAtSnapTimeThreshold);
    write(snapTimeThreshold, value);
}

void tServo::setSpikeFilterEnabled(bool value) { write(spikeFilterEnabled, value); }

void tServo::setSpikeFilterHistorySize(uint32_t value)
{
    check(value, kHistorySize, zverr::kAtSpikeFilterHistorySize);
    write(spikeFilterHistorySize, value);
}

void tServo::setSpikeFilterMaxThreshold(double value)
{
    check(value, kThreshold, zverr::kAtSpikeFilterMaxThreshold);
    write(spikeFilterMaxThreshold, value);
}

void tServo::setSpikeFilterMinThreshold(double value)
{
    check(value, kThreshold, zverr::kAtSpikeFilterMinThreshold);
    write(spikeFilterMinThreshold, value);
}

void tServo::setSpikeFilterGrowthFactor(double value)
{
    check(value, kGrowthFactor, zverr::kAtSpikeFilterGrowthFactor);
    write(spikeFilterGrowthFactor, value);
}

} // namespace zvckmDravik
