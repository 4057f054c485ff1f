#pragma once

#include "maths/tKalmanFilter.h"
#include "selftune/tBelief.h"
#include "selftune/tDoubtfulPairs.h"
#include "selftune/tNoiseLevel.h"
#include "selftune/tWanderBank.h"

#include <array>
#include <cstdint>
#include <optional>

namespace dravikHost {

// Where a clock is and how fast it runs, estimated from measurements of which nothing is known
// beforehand. Phase and frequency are errors of the clock as it is steered now: positive is ahead,
// and fast.
class tClockEstimate
{
public:
    enum tEvent {
        kAsForeseen,
        kFirst,          // of two, which only begin the estimate
        kRejected,       // as far off as it should not be; what it means may show later
        kJumped,         // the reference, and it stays there; then jumpNs() tells by how much
        kJumpedBack,     // to where it was before
        kOtherFrequency, // of the oscillator
        kOtherNoise,
        kUseless, // not later than the one before, or beyond all measure
    };

    // At the end of a row of so many clocks, all held like this one, gains that are best for one
    // alone add up what they pass on.
    explicit tClockEstimate(int hops = 1) : hops(hops) {}

    // A measured error; all steps and orders up to then were told before. Gains that are nearly as
    // good as the filter's own are used in their place; null: none.
    tEvent take(int64_t elapsedNs, int64_t errorNs, const tKalmanFilter::tGains* preferred);

    // Lets time pass without a measurement.
    void wait(int64_t elapsedNs);

    void steered(double byPpb); // the offset in force has changed by so much
    void stepped(int64_t byNs);
    void restart();

    // Pairs that were as foreseen, and the first two.
    int64_t pairs() const { return count; }

    double phaseNs() const { return static_cast<double>(baseNs) + filter.phase; }
    double frequencyPpb() const { return filter.frequency; }
    double secondsPerPair() const { return pace; } // mostly
    double secondsSincePair(int64_t elapsedNs) const;
    double jumpNs() const { return lastJumpNs; }
    const tKalmanFilter::tGains& gains() const { return latestGains; } // of the latest good pair
    tBelief belief() const;

private:
    tEvent begin(double phaseNs, double passed);
    tEvent judge(double phaseNs, const tKalmanFilter::tGains* preferred);
    bool isDoubtful(double innovation) const;
    tEvent doubt(double innovation);
    tEvent trust(double phaseNs, const tKalmanFilter::tGains* preferred);
    tKalmanFilter::tGains gainsOfChain();
    void useGains(const tKalmanFilter::tGains& gains, double innovation);
    double wanderShare() const;
    void move(double phaseNs, double frequencyPpb, const tCovariance& doubt);
    void changeNoise(double times);
    void learnPace(double passed);
    double varianceFactor() const { return filter.covariance.xx + 1; }
    bool isFinite() const;

    int hops;
    tKalmanFilter::tGains chain{}; // for the ratio of wander that was believed then
    double chainRatio = 0;
    int64_t baseNs = 0;              // phases are told from there, which keeps their digits
    std::optional<int64_t> pairNs;   // when the latest pair was
    std::optional<int64_t> latestNs; // up to when the estimate is
    int64_t count = 0;               // pairs taken
    double measuredNs = 0;           // latest, from the base
    tKalmanFilter filter;            // covariance in units of the noise's variance
    tKalmanFilter::tGains latestGains{};
    tWanderBank bank;
    tNoiseLevel noise;
    tDoubtfulPairs doubtful;
    double interval = 1; // between the first two pairs, in seconds
    double pace = 1;
    std::array<double, 9> latestSeconds{};
    size_t paceCount = 0;
    double seconds = 0;    // since the first pair
    double lastJumpNs = 0; // 0: none that may be taken back
    int64_t sinceJump = 0; // pairs
};

} // namespace dravikHost
