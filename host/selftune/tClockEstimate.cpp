#include "selftune/tClockEstimate.h"

#include "maths/chainGains.h"
#include "text/quantity.h"

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

constexpr double kGate = 6; // deviations beyond which a measurement is doubtful
constexpr double kGateInDoubt = 3.5;
constexpr int64_t kYoung = 8;         // pairs in which nothing is
constexpr int64_t kJumpMayEnd = 1000; // pairs after which a jump is taken for good

} // namespace

tClockEstimate::tEvent tClockEstimate::take(int64_t elapsedNs, int64_t errorNs,
                                            const tKalmanFilter::tGains* preferred)
{
    if (pairNs && elapsedNs <= *pairNs) return kUseless;
    const double passed = pairNs ? secondsOf(elapsedNs - *pairNs) : 0;
    pairNs = elapsedNs;
    if (count == 0) {
        latestNs = elapsedNs;
        baseNs = errorNs;
        count = 1;
        return kFirst;
    }
    const auto phaseNs = static_cast<double>(
        static_cast<int64_t>(static_cast<uint64_t>(errorNs) - static_cast<uint64_t>(baseNs)));
    seconds += passed;
    learnPace(passed);
    noise.seeChange(phaseNs - measuredNs);
    measuredNs = phaseNs;
    if (count == 1) {
        latestNs = elapsedNs;
        return begin(phaseNs, passed);
    }
    wait(elapsedNs);
    const tEvent event = judge(phaseNs, preferred);
    if (isFinite()) return event;
    restart();
    return kUseless;
}

// The order in force was the same between the two.
tClockEstimate::tEvent tClockEstimate::begin(double phaseNs, double passed)
{
    interval = passed;
    filter.phase = phaseNs;
    filter.frequency = phaseNs / passed;
    filter.covariance = {1, 1 / passed, 2 / (passed * passed)};
    bank.begin(filter, passed);
    count = 2;
    return kFirst;
}

void tClockEstimate::wait(int64_t elapsedNs)
{
    if (count < 2 || elapsedNs <= *latestNs) return;
    const double passed = secondsOf(elapsedNs - *latestNs);
    latestNs = elapsedNs;
    filter.predict(passed, disturbance(0, wanderShare(), passed));
    bank.predict(passed);
}

double tClockEstimate::secondsSincePair(int64_t elapsedNs) const
{
    return pairNs ? secondsOf(elapsedNs - *pairNs) : 0;
}

// Of the noise, in ppb per root second.
double tClockEstimate::wanderShare() const
{
    return bank.ratio() / (interval * std::sqrt(interval));
}

tClockEstimate::tEvent tClockEstimate::judge(double phaseNs, const tKalmanFilter::tGains* preferred)
{
    const double innovation = phaseNs - filter.phase;
    ++sinceJump;
    if (isDoubtful(innovation)) return doubt(innovation);
    doubtful.takeGood({seconds, innovation});
    return trust(phaseNs, preferred);
}

// What little is known at first makes a wide gate. Among doubtful ones more is asked of one that is
// to be believed: the gate widens as time passes, and many tried it.
bool tClockEstimate::isDoubtful(double innovation) const
{
    constexpr double kWiderAtFirst = 15;
    if (count < kYoung) return false;
    const double gate =
        (doubtful.any() ? kGateInDoubt : kGate) * (1 + kWiderAtFirst / static_cast<double>(count));
    return innovation * innovation > gate * gate * varianceFactor() * noise.variance();
}

// A reference that was wrong for a while is believed again at once.
tClockEstimate::tEvent tClockEstimate::doubt(double innovation)
{
    const double variance = noise.variance();
    const double within = kGate * std::sqrt(varianceFactor() * variance);
    const bool mayEnd = lastJumpNs != 0 && sinceJump < kJumpMayEnd;
    if (mayEnd && std::fabs(innovation + lastJumpNs) < within) {
        move(-lastJumpNs, 0, {});
        lastJumpNs = 0;
        doubtful.forget();
        return kJumpedBack;
    }
    const auto verdict = doubtful.takeDoubtful({seconds, innovation}, variance);
    if (verdict.finding == tDoubtfulPairs::kNothing) return kRejected;
    doubtful.forget();
    switch (verdict.finding) {
    case tDoubtfulPairs::kJump:
        lastJumpNs = verdict.phaseNs + (mayEnd ? lastJumpNs : 0);
        sinceJump = 0;
        move(verdict.phaseNs, 0, {0.25, 0, 0}); // seen four times or more
        return kJumped;
    case tDoubtfulPairs::kNewFrequency:
        move(verdict.phaseNs, verdict.frequencyPpb, {1, 0, verdict.frequencyVariance / variance});
        return kOtherFrequency;
    default:
        move(verdict.phaseNs, 0, {});
        changeNoise(noise.restartAt(verdict.noiseVariance));
        return kOtherNoise;
    }
}

// Gains that are nearly as good as the filter's own are used, so that they need not be changed.
tClockEstimate::tEvent tClockEstimate::trust(double phaseNs, const tKalmanFilter::tGains* preferred)
{
    constexpr double kNear = 0.08;
    constexpr double kSettled = 4; // pairs, over those that the gain remembers
    const double innovation = phaseNs - filter.phase;
    changeNoise(noise.take(innovation * innovation / varianceFactor()));
    bank.take(phaseNs, noise.variance());
    latestGains = filter.update(innovation, 1);
    const auto near = [](double one, double other) {
        return std::fabs(one - other) <= kNear * one;
    };
    if (hops > 1) {
        const tKalmanFilter::tGains best = gainsOfChain();
        if (best.phase * static_cast<double>(count) > kSettled) useGains(best, innovation);
    }
    if (preferred != nullptr && near(latestGains.phase, preferred->phase) &&
        near(latestGains.frequency, preferred->frequency))
        useGains(*preferred, innovation);
    ++count;
    return kAsForeseen;
}

tKalmanFilter::tGains tClockEstimate::gainsOfChain()
{
    constexpr double kOther = 1.25;
    const double ratio = bank.ratio();
    if (ratio > kOther * chainRatio || ratio * kOther < chainRatio) {
        constexpr double kHardlyAny = 1e-9;
        const tChainGains best = bestChainGains({kHardlyAny, ratio * ratio}, hops);
        chain = {best.phase, best.frequency / interval};
        chainRatio = ratio;
    }
    return chain;
}

// In place of those that the filter has used.
void tClockEstimate::useGains(const tKalmanFilter::tGains& gains, double innovation)
{
    filter.phase += (gains.phase - latestGains.phase) * innovation;
    filter.frequency += (gains.frequency - latestGains.frequency) * innovation;
    latestGains = gains;
}

// What is known of the clock stays known as well in nanoseconds.
void tClockEstimate::changeNoise(double times)
{
    if (times == 1) return;
    tCovariance& p = filter.covariance;
    p = {p.xx / (times * times), p.xy / (times * times), p.yy / (times * times)};
    bank.noiseGrew(times);
}

void tClockEstimate::move(double phaseNs, double frequencyPpb, const tCovariance& doubt)
{
    filter.move(phaseNs, frequencyPpb, doubt);
    bank.move(phaseNs, frequencyPpb, doubt);
}

void tClockEstimate::steered(double byPpb) { move(0, byPpb, {}); }

void tClockEstimate::stepped(int64_t byNs)
{
    baseNs = static_cast<int64_t>(static_cast<uint64_t>(baseNs) + static_cast<uint64_t>(byNs));
}

void tClockEstimate::restart() { *this = tClockEstimate(hops); }

tBelief tClockEstimate::belief() const
{
    const double deviation = std::sqrt(noise.variance());
    tKalmanFilter next = filter;
    next.predict(pace, disturbance(0, wanderShare(), pace));
    return {deviation, wanderShare() * deviation, latestGains.phase,
            deviation * std::sqrt(next.covariance.xx)};
}

// The median of the latest spacings: some pairs may be missing.
void tClockEstimate::learnPace(double passed)
{
    latestSeconds[paceCount++ % latestSeconds.size()] = passed;
    const size_t known = std::min(paceCount, latestSeconds.size());
    auto sorted = latestSeconds;
    const auto middle = sorted.begin() + static_cast<std::ptrdiff_t>((known - 1) / 2);
    std::nth_element(sorted.begin(), middle, sorted.begin() + static_cast<std::ptrdiff_t>(known));
    pace = *middle;
}

bool tClockEstimate::isFinite() const
{
    const tCovariance& p = filter.covariance;
    const double all =
        filter.phase + filter.frequency + p.xx + p.xy + p.yy + noise.variance() + bank.ratio();
    return std::isfinite(all);
}

} // namespace dravikHost
