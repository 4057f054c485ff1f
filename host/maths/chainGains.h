#pragma once

namespace dravikHost {

// Clocks in a row, each held to the one before by the same loop: what disturbs each of them, as
// variances against that of one measurement, which is the same white noise at each.
struct tChainNoise {
    double white; // what white frequency noise adds to the phase from pair to pair
    double walk;  // what the walk adds to the frequency from pair to pair, times the interval

    // Of noise in ns, and what the oscillator does as for disturbance().
    static tChainNoise of(double noiseNs, double frequencyNoisePpb, double wanderPpb,
                          double interval);
};

// Gains of phase and frequency per pair, in units of the interval: kp T and ki T of a
// proportional-integral controller.
struct tChainGains {
    double phase, frequency;
};

// Of the last of so many clocks at the moments of measurement, against that of a measurement;
// infinite if the loop is not stable.
double chainVariance(const tChainNoise& noise, const tChainGains& gains, int hops);

// Those with the least variance at the last clock. Plain arithmetic and square roots: the same bits
// on every machine, after some 10,000 of them a clock. Noise and walk are above 0.
tChainGains bestChainGains(const tChainNoise& noise, int hops);

} // namespace dravikHost
