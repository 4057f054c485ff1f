#pragma once

#include "dravik/iServoConfig.h"
#include "dravik/iServoSMController.h"
#include "dravik/iTimekeeper.h"
#include "dravik/tServoStateFrequencyLock.h"
#include "dravik/tServoStateIdle.h"
#include "dravik/tServoStatePhaseLock.h"
#include "dravik/tServoStateSnapTime.h"
#include "zvckmservo/parameters.h"
#include "zvckmservo/servo.h"
#include "zvplat/quarks/synchronization.h"

#include <cstdint>
#include <string>

namespace zvckmDravik {

// The servo of one clock: the states, the parameters, and the one lock. It stands between the
// states, which see it through the three interfaces only, and the host's table of integers.
//
// Every public operation takes the lock and holds it across the host's operations; it is recursive
// because the states call back in. Construction and destruction run without it.
class tServo : protected iServoConfig, protected iServoSMController, protected iTimekeeper
{
public:
    // Asks the host for its limits and starts in frequency lock. `host` is borrowed. Raises what
    // the host reports, and zvplaterr_softwareFaultPLATInternalUseOnly if there is no mutex.
    explicit tServo(zvckmservo_HostTable* host);
    ~tServo() override = default;

    void clearHistory();
    void adjustTime(const tTimeSpan& reference, const tTimeSpan& clock);
    tTimeSpan getTime();

    std::string readServoConfigJson() override;
    void writeServoConfigJson(const std::string& json) override;
    // Applies the document in a file, read under the lock. A file that cannot be opened is told in
    // the system log and changes nothing.
    virtual void readConfigFile(const std::string& path);
    // Loads the default document of the selected time reference's type, once per change of type.
    void applyMetaData(const std::string& metaDataJson);

protected:
    double getFrequencyLockGain() const override;
    double getPhaseLockGain() const override;
    double getPhaseLockCoefficientA() const override;
    double getPhaseLockCoefficientB() const override;
    double getPhaseLockCoefficientC() const override;
    double getSnapTimeThreshold() const override;
    double getMaxFrequencyOffset() const override;
    double getMinFrequencyOffset() const override;
    bool getSpikeFilterEnabled() const override;
    uint32_t getSpikeFilterHistorySize() const override;
    double getSpikeFilterMaxThreshold() const override;
    double getSpikeFilterMinThreshold() const override;
    double getSpikeFilterGrowthFactor() const override;

    void setFrequencyLockGain(double value) override;
    void setPhaseLockGain(double value) override;
    void setPhaseLockCoefficientA(double value) override;
    void setPhaseLockCoefficientB(double value) override;
    void setPhaseLockCoefficientC(double value) override;
    void setSnapTimeThreshold(double value) override;
    void setSpikeFilterEnabled(bool value) override;
    void setSpikeFilterHistorySize(uint32_t value) override;
    void setSpikeFilterMaxThreshold(double value) override;
    void setSpikeFilterMinThreshold(double value) override;
    void setSpikeFilterGrowthFactor(double value) override;

    void setState(tServoStateId id) override;

    void stepTime(const tTimeSpan& delta) override;
    double getFrequency() override;
    void setFrequency(double ratio) override;

private:
    iServoState& stateOf(tServoStateId id);

    static constexpr double initial(zvckmservo_ParameterIndex index)
    {
        return zvckmservo_parameters[index].initial;
    }

    // One member under the lock; nothing can throw in between.
    template <class T> T read(const T& member) const;
    template <class T> void write(T& member, T value);

    mutable tMutex mutex;
    zvckmservo_HostTable* host; // the host's; never freed

    tServoStateIdle idleState;
    tServoStateFrequencyLock frequencyLockState;
    tServoStatePhaseLock phaseLockState;
    tServoStateSnapTime snapTimeState;
    iServoState* currentState; // one of the four above, never null

    double frequencyLockGain = initial(zvckmservo_kFrequencyLockGain);
    double phaseLockGain = initial(zvckmservo_kPhaseLockGain);
    double phaseLockCoefficientA = initial(zvckmservo_kPhaseLockCoefficientA);
    double phaseLockCoefficientB = initial(zvckmservo_kPhaseLockCoefficientB);
    double phaseLockCoefficientC = initial(zvckmservo_kPhaseLockCoefficientC);
    double snapTimeThreshold = initial(zvckmservo_kSnapTimeThreshold);
    double maxFrequencyOffset = 0.0; // from the host, at construction
    double minFrequencyOffset = 0.0;
    bool spikeFilterEnabled = initial(zvckmservo_kSpikeFilterEnabled) != 0;
    uint32_t spikeFilterHistorySize =
        static_cast<uint32_t>(initial(zvckmservo_kSpikeFilterHistorySize));
    double spikeFilterMaxThreshold = initial(zvckmservo_kSpikeFilterMaxThreshold);
    double spikeFilterMinThreshold = initial(zvckmservo_kSpikeFilterMinThreshold);
    double spikeFilterGrowthFactor = initial(zvckmservo_kSpikeFilterGrowthFactor);

    std::string timeReferenceType; // of the last metadata applied; empty at first
};

} // namespace zvckmDravik
