#pragma once

#include "servo/tLockObserver.h"
#include "servo/tServoHost.h"
#include "servo/tServoParameters.h"

#include <optional>

namespace dravikHost {

// A servo of the plug-in that orders fractions of a ppb. The law begins each pair from the whole
// ppb that the clock took, so what was rounded off adds up as a walk of the frequency. Here the
// plug-in is shown a clock on which everything is so many times as large: its error, its offset and
// limits, and the thresholds. Outside of this class all is as it is.
class tFineServo
{
public:
    static constexpr int kFinest = 64; // a little more than a unit of the kernel

    // The greatest factor, a power of two up to the one given, at which the limit of the clock and
    // the threshold can still be shown to the plug-in.
    static int factorFor(int atMost, double limitPpb, double snapTimeThreshold);
    static double limitOf(iClock& clock); // the wider one

    // Library and clock are borrowed. Throws as adjustTime does.
    tFineServo(const tServoLibrary& library, iClock& clock, int factor,
               const tServoParameters& parameters);

    // Returns what the pair led to. Throws what the clock threw, or else std::runtime_error with
    // the plug-in's code and payload; the calls made until then are kept.
    tLockEvent adjustTime(uint64_t referenceNs, uint64_t clockNs);

    // Forgets what it measured. Throws std::runtime_error.
    void clearHistory();

    int factor() const { return enlarged.factor; }

    // Throws std::runtime_error if it is too large for the factor.
    void requireThreshold(double snapTimeThreshold) const;

    // Throws std::runtime_error if a parameter is refused, or the threshold as above.
    void writeParameters(const tServoParameters& parameters);

    const tServoParameters& parameters() const { return inForce; }

    // What the plug-in asked of the clock during the last pair, or during initialisation.
    const tHostCalls& calls() const { return realCalls; }
    bool locked() const { return lock.locked(); }
    bool measuring() const { return lock.measuring(); }

private:
    struct tShown {
        uint64_t referenceNs, clockNs;
    };
    struct tFirstPair {
        uint64_t referenceNs, clockNs;
        tShown shown;
    };

    // The clock as the plug-in sees it.
    class tEnlargedClock : public iClock
    {
    public:
        tEnlargedClock(iClock& clock, int factor) : clock(clock), factor(factor) {}

        uint64_t timeNs() override { return clock.timeNs(); }
        void step(int64_t deltaNs) override;
        double offsetPpb() override { return enlarged(clock.offsetPpb()); }
        void setOffsetPpb(double shownPpb) override { clock.setOffsetPpb(shownPpb / factor); }
        int32_t maxOffsetPpb() override { return factor * clock.maxOffsetPpb(); }
        int32_t minOffsetPpb() override { return factor * clock.minOffsetPpb(); }

        double enlarged(double realPpb) const;

        iClock& clock;
        int factor;
        int64_t correctionNs = 0; // by which a step puts the pair right that the plug-in is given
    };

    tShown show(uint64_t referenceNs, uint64_t clockNs);
    std::optional<tShown> showSecond(uint64_t referenceNs, uint64_t clockNs);
    void handOver(const tShown& shown);
    void noteCalls();

    tEnlargedClock enlarged;
    tServoHost host;
    tLockObserver lock;
    tServoParameters inForce;
    tHostCalls realCalls;
    std::optional<uint64_t> originNs; // the first reference of all
    std::optional<tFirstPair> first;  // of the measurement that goes on
};

} // namespace dravikHost
