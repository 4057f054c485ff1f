#pragma once

#include "clocks/iClock.h"
#include "selftune/tBelief.h"
#include "selftune/tClockEstimate.h"
#include "servo/tFineServo.h"
#include "servo/tHostCall.h"
#include "servo/tLoopGains.h"

#include <cstdint>
#include <optional>
#include <string>

namespace dravikHost {

// Tunes a servo while it runs, from nothing but the pairs. Of each pair an estimate of the clock is
// made; the gains that it used are those of the servo's law,
//
//     u(n) - u(n-1) = -(K1/T + K2) x(n) + K1/T x(n-1)
//
// which goes on by itself while pairs come as they should. Where they do not, as one was missing,
// was not believed, or came when the gains had changed, the law remembers another past than there
// was: then the clock is ordered something first, from which the law arrives at what the estimate
// wants.
class tSelfTuning
{
public:
    // Both are borrowed. Writes the document to acquire a lock with. Throws as the servo does.
    tSelfTuning(tFineServo& servo, iClock& clock, int hops);

    // Before a pair is given to the servo: whether it is to be. May order the clock, and step it
    // where its rate cannot bring it back within some pairs; throws what the clock throws.
    bool prepare(int64_t elapsedNs, int64_t errorNs);

    // What the servo did with a pair that it was given.
    void follow(int64_t errorNs, tLockEvent event, const tHostCalls& calls);

    // Pairs have failed to come: the clock is let run at its estimated rate, without what was added
    // to it to bring it back by the next pair. Returns whether that was ordered.
    bool coast(int64_t elapsedNs);

    void restart(); // the servo measures anew

    const tHostCalls& orders() const { return ownOrders; } // in prepare() or coast()
    const std::string& note() const
    {
        return noteText;
    } // on the latest pair, for people; mostly ""
    tBelief belief() const { return estimate.belief(); }

private:
    bool lawActs() const { return snapped || servo.locked(); }
    double wantedPpb() const;
    void chooseGains();
    void prepareLaw(int64_t errorNs);
    void order(double ppb);
    void stepBack();
    void writeDocument(const tLoopGains& gains, double snapTimeThreshold);
    std::string textOf(tClockEstimate::tEvent event, const tBelief& before) const;

    tFineServo& servo;
    iClock& clock;
    tClockEstimate estimate;
    double inForcePpb = 0;                        // as last seen
    bool snapped = false;                         // the next pair is the law's first
    double lawErrorNs = 0;                        // the last one that the law remembers
    bool isCoasting = false;                      // ordered already
    std::optional<tKalmanFilter::tGains> written; // in force, as a filter has them
    tLoopGains law{};                             // the same
    int unlike = 0; // good pairs in a row that would have had other gains
    tHostCalls ownOrders;
    std::string noteText;
};

} // namespace dravikHost
