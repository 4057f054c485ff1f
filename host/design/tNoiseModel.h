#pragma once

#include <cstdint>

// What disturbs a loop. A frequency of 1 ppb is 1 ns per second, so phases are in ns throughout.
struct tNoiseModel {
    int64_t intervalNs = 0;       // from pair to pair
    double noiseNs = 0;           // of each measurement; white, standard deviation
    double frequencyNoisePpb = 0; // white, of the oscillator; Allan deviation at 1 s
    double wanderPpb = 0;         // random walk of its frequency; standard deviation after 1 s
    double outlierRate = 0;       // share of measurements that are far off
    double outlierSizeNs = 0;     // by which they are, with either sign

    double interval() const { return static_cast<double>(intervalNs) * 1e-9; } // s
};

// What the oscillator adds to phase and frequency in some seconds, as variances and covariance in
// ns^2, ns ppb and ppb^2.
struct tCovariance {
    double xx, xy, yy;
};
inline tCovariance disturbance(double frequencyNoisePpb, double wanderPpb, double seconds)
{
    const double white = frequencyNoisePpb * frequencyNoisePpb;
    const double walk = wanderPpb * wanderPpb;
    return {white * seconds + walk * seconds * seconds * seconds / 3, walk * seconds * seconds / 2,
            walk * seconds};
}
