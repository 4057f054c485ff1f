#include "maths/chainGains.h"

#include "maths/patternSearch.h"

#include <algorithm>
#include <cmath>
#include <limits>

// With y = 1 - cos w, w the angle from pair to pair, K1 and K2 the gains and a = K1 + K2, the loop
//
//     x(n+1) = x(n) + f(n) - K1 m(n) - K2 (m(1) + ... + m(n))
//
// with measurements m has |D|^2 = K2^2 + (2 a K1 - 4 K2) y + 4 (1 - K1) y^2. Through it pass, as
// powers,
//
//     of its reference and of noise   H = (K2^2 + 2 a K1 y) / |D|^2
//     of its own oscillator           O = (2 white y + walk (1 - y / 3)) / |D|^2
//
// so that the last of N clocks has the mean of (H + O) (1 + H + ... + H^(N-1)) over all angles.

namespace dravikHost {

namespace {

constexpr double kPi = 3.14159265358979323846;

// No other gains are better at one clock: the steady state of a two-state filter, where
// K2^2 = walk (1 - K1) and K1^2 = K2 (2 - K1) - K2^2 / 6 + white (1 - K1).
tChainGains gainsOfOne(const tChainNoise& noise)
{
    constexpr int kHalvings = 100;
    constexpr double kMostFrequency = 3; // beyond it the phase is too small, whatever stands there
    double low = 0;
    double high = 1;
    tChainGains gains{};
    for (int i = 0; i < kHalvings; ++i) {
        const double phase = (low + high) / 2;
        const double frequency = std::min(std::sqrt(noise.walk * (1 - phase)), kMostFrequency);
        const double wanted =
            frequency * (2 - phase) - frequency * frequency / 6 + noise.white * (1 - phase);
        gains = {phase, frequency};
        (phase * phase < wanted ? low : high) = phase;
    }
    return gains;
}

} // namespace

tChainNoise tChainNoise::of(double noiseNs, double frequencyNoisePpb, double wanderPpb,
                            double interval)
{
    const double variance = noiseNs * noiseNs;
    return {frequencyNoisePpb * frequencyNoisePpb * interval / variance,
            wanderPpb * wanderPpb * interval * interval * interval / variance};
}

// The mean by t = tan(w/2), and t = K1 r^3 with r = s / (1 - s), s from 0 to 1: so all is smooth,
// is nothing at both ends, and a hundred points tell eight digits, however slow the loop is.
double chainVariance(const tChainNoise& noise, const tChainGains& gains, int hops)
{
    constexpr int kPoints = 100;
    const double k1 = gains.phase;
    const double k2 = gains.frequency;
    const bool stable = k1 > 0 && k2 > 0 && 2 * k1 + k2 < 4;
    if (!stable) return std::numeric_limits<double>::infinity();
    const double passed = 2 * k1 * (k1 + k2);
    double sum = 0;
    for (int i = 0; i < kPoints; ++i) {
        const double s = (i + 0.5) / kPoints;
        const double r = s / (1 - s);
        const double t = k1 * r * r * r;
        const double y = 2 * t * t / (1 + t * t);
        const double d = k2 * k2 + (passed - 4 * k2) * y + 4 * (1 - k1) * y * y;
        const double h = (k2 * k2 + passed * y) / d;
        const double own = (2 * noise.white * y + noise.walk * (1 - y / 3)) / d;
        double series = 0;
        for (int hop = 0; hop < hops; ++hop)
            series = 1 + h * series;
        const double width = 6 * k1 * r * r / ((1 - s) * (1 - s)) / (1 + t * t); // of w, per s
        sum += (h + own) * series * width;
    }
    return sum / (kPoints * kPi);
}

// Places are roots of factors, as gains have no scale of their own: at the end of a long chain the
// frequency's is a fiftieth of what it is at one clock.
tChainGains bestChainGains(const tChainNoise& noise, int hops)
{
    constexpr double kStep = 0.1;
    constexpr int kHalvings = 5;
    const tChainGains one = gainsOfOne(noise);
    const auto gainsAt = [&one](const std::vector<double>& place) {
        const double square = place[1] * place[1];
        return tChainGains{one.phase * place[0] * place[0], one.frequency * square * square};
    };
    std::vector<double> place = {1, 1};
    patternSearch(
        [&](const std::vector<double>& at) { return chainVariance(noise, gainsAt(at), hops); },
        place, {kStep, kStep}, kHalvings);
    return gainsAt(place);
}

} // namespace dravikHost
