#pragma once

#include "maths/tNoise.h"

#include <array>

namespace dravikHost {

// Flicker noise: a spectrum of 1/f, whatever the time from number to number. It begins at 0.
class tFlicker
{
public:
    explicit tFlicker(const tNoise& noise) : noise(noise) {}

    // The next number of a noise whose deviation of that kind is the one given, over 1 number as
    // over a million. At 0 none is drawn.
    double withAllan(double ppb); // of frequencies
    double withTime(double ns);   // TDEV, of times

private:
    double next(); // spectrum of 1/f, one-sided

    // Walks that are drawn back to 0, each four times as slowly as the one before.
    static constexpr size_t kStages = 12;

    tNoise noise;
    std::array<double, kStages> stages{};
};

} // namespace dravikHost
