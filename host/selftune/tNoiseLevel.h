#pragma once

#include <array>
#include <cstddef>

namespace dravikHost {

// How much measurements scatter. A mean of squares follows slowly and precisely; beside it levels,
// each twice the one before, compete for the latest pairs, so that a noise that is another one is
// known within some ten of them.
class tNoiseLevel
{
public:
    tNoiseLevel();

    double variance() const { return inForce; } // ns^2

    // Of coarse timestamps many are alike: the scatter is not less than that of their steps.
    void seeChange(double changeNs); // of the measured error, from pair to pair

    // The square of what was not foreseen, in ns^2, over how much more it should be than the noise.
    // Returns how many times the noise's deviation is what it was, if it is another noise; else 1.
    double take(double square);

    // It is another noise, of that variance; returns as take does.
    double restartAt(double variance);

private:
    static constexpr size_t kLevels = 24;
    static constexpr size_t kChanges = 40;

    double believedVariance();
    double anchorAt(double variance);
    double set(double variance, bool another);

    double inForce = 0; // 0: nothing known
    double sum = 0;
    double weight = 0;
    double floorVariance;
    std::array<double, kLevels> shares{};
    std::array<double, kChanges> changes{}; // latest, 0 where there was none
    size_t changeCount = 0;
    int taken = 0;
    int elsewhere = 0; // pairs in a row after which the levels disagreed with the mean
};

} // namespace dravikHost
