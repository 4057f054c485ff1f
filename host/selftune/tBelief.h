#pragma once

namespace dravikHost {

// What self-tuning believes of a clock and of what measures it.
struct tBelief {
    double noiseNs = 0;   // of a measurement, deviation
    double wanderPpb = 0; // of the oscillator, per root second
    double gain = 0;      // share of what was not foreseen that is taken for the clock's
    double errorNs = 0;   // of the clock at the next pair, deviation
};

} // namespace dravikHost
