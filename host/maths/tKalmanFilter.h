#pragma once

namespace dravikHost {

// Variances of phase and frequency, and their covariance: in ns^2, ppb^2 and ns ppb, as a frequency
// of 1 ppb is 1 ns per second.
struct tCovariance {
    double xx, xy, yy;
};

// What an oscillator adds to its phase and frequency in some seconds.
//   frequencyNoisePpb  white; Allan deviation at 1 s
//   wanderPpb          random walk; standard deviation after 1 s
tCovariance disturbance(double frequencyNoisePpb, double wanderPpb, double seconds);

// A clock's phase and frequency, as far as measurements of the phase tell them.
struct tKalmanFilter {
    double phase = 0;
    double frequency = 0;
    tCovariance covariance{};

    struct tGains {
        double phase, frequency; // of what was not foreseen
    };

    void predict(double seconds, const tCovariance& added);

    // The clock is elsewhere and runs otherwise by so much, as far as is known.
    void move(double phaseBy, double frequencyBy, const tCovariance& doubt);

    // Takes a measurement that differs from the phase by the innovation.
    tGains update(double innovation, double noiseVariance);
};

} // namespace dravikHost
