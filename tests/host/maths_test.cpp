#include "maths/chainGains.h"
#include "maths/median.h"
#include "maths/patternSearch.h"
#include "maths/tFlicker.h"
#include "maths/tKalmanFilter.h"
#include "maths/tNoise.h"

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <cmath>

using namespace dravikHost;

namespace {

// The ten thousandth number of this generator from this seed is fixed: 9981545732273789042.
TEST(Noise, isTheSameEverywhere)
{
    tNoise noise(5489);
    for (int i = 0; i < 9999; ++i)
        noise.uniform();
    EXPECT_EQ(std::ldexp(9981545732273789042U >> 11U, -53), noise.uniform());

    tNoise normal(1);
    for (const double value : {-0x1.42c3b2b72217p-5, -0x1.8c1da014dda08p-2, -0x1.fdd85e535a47ap-3,
                               0x1.5fa75918ca312p-1, -0x1.bfaac17196979p-5, -0x1.971d689089fdcp-1})
        EXPECT_EQ(value, normal.normal());
}

TEST(Flicker, isTheSameEverywhere)
{
    tFlicker flicker(tNoise(3));
    EXPECT_EQ(0, flicker.withAllan(0));
    std::string found;
    for (int i = 0; i < 3; ++i) {
        found += fmt::format("{:.10g} ", flicker.withAllan(1));
        found += fmt::format("{:.10g} ", flicker.withTime(2));
    }
    EXPECT_EQ("-0.6109220165 0.179705789 1.984746914 3.888489139 -2.288139017 -2.603923496 ",
              found);
}

TEST(KalmanFilter, doesWhatIsWorkedOutByHand)
{
    tKalmanFilter filter{1, 3, {1, 0.5, 0.25}};
    filter.predict(2, {0.1, 0.2, 0.3});
    EXPECT_DOUBLE_EQ(7, filter.phase);
    EXPECT_DOUBLE_EQ(4.1, filter.covariance.xx);
    EXPECT_DOUBLE_EQ(1.2, filter.covariance.xy);
    EXPECT_DOUBLE_EQ(0.55, filter.covariance.yy);

    const tKalmanFilter::tGains gains = filter.update(2, 0.9);
    EXPECT_DOUBLE_EQ(0.82, gains.phase);
    EXPECT_DOUBLE_EQ(0.24, gains.frequency);
    EXPECT_DOUBLE_EQ(8.64, filter.phase);
    EXPECT_DOUBLE_EQ(3.48, filter.frequency);
    EXPECT_NEAR(0.738, filter.covariance.xx, 1e-15);
    EXPECT_NEAR(0.216, filter.covariance.xy, 1e-15);
    EXPECT_NEAR(0.262, filter.covariance.yy, 1e-15);

    const tCovariance added = disturbance(2, 3, 2);
    EXPECT_DOUBLE_EQ(32, added.xx);
    EXPECT_DOUBLE_EQ(18, added.xy);
    EXPECT_DOUBLE_EQ(18, added.yy);
}

// Against the squares of what one impulse of each disturbance does to a row of loops, pair by pair.
TEST(ChainGains, foretellTheLastOfManyClocks)
{
    EXPECT_NEAR(2.2571101798, chainVariance({0, 4e-4}, {0.2, 0.01}, 7), 1e-6);
    EXPECT_NEAR(126.02331922, chainVariance({1e-3, 4e-4}, {0.22, 0.003}, 50), 1e-4);
    EXPECT_NEAR(1.4580896686, chainVariance({1e-3, 4e-4}, {0.9, 0.3}, 1), 1e-6);
    EXPECT_TRUE(std::isinf(chainVariance({0, 1}, {1.5, 1.1}, 1)));
}

// At one clock those of the steady Kalman filter, with an error of K1 / (1 - K1) of a
// measurement's; none near them is better at the end of a row.
TEST(ChainGains, areTheBest)
{
    for (const tChainNoise& noise : {tChainNoise::of(50, 0, 1, 1),
                                     tChainNoise::of(50, 3, 10, 0.125),
                                     tChainNoise{1e-3, 1e-16},
                                     {0, 1e6}}) {
        const auto [a, b] = bestChainGains(noise, 1);
        EXPECT_NEAR(a * a, b * (2 - a) - b * b / 6 + noise.white * (1 - a), 1e-2 * a * a);
        EXPECT_NEAR(a / (1 - a), chainVariance(noise, {a, b}, 1), 1e-2 * a / (1 - a));
        const auto [phase, frequency] = bestChainGains(noise, 7);
        const double least = 0.9999 * chainVariance(noise, {phase, frequency}, 7);
        for (const double change : {0.95, 1.05}) {
            EXPECT_LT(least, chainVariance(noise, {change * phase, frequency}, 7));
            EXPECT_LT(least, chainVariance(noise, {phase, change * frequency}, 7));
        }
    }
}

TEST(Median, isTheUpperOfTheMiddle)
{
    EXPECT_EQ(2, median<int>({3, 1, 2}));
    EXPECT_EQ(3, median<int>({4, 1, 3, 2}));
    EXPECT_EQ(0.5, median<double>({0.5}));
}

TEST(PatternSearch, goesDownhillUntilItsStepsAreSpent)
{
    const auto bowl = [](const std::vector<double>& at) {
        return at[0] > 5 ? std::nan("") : std::hypot(at[0] - 3, 2 * (at[1] + 0.75)) + 0.5;
    };
    for (const auto& [halvings, x, y] : {std::tuple(0, 4.0, -1.0), {1, 4, -1}, {2, 3, -0.75}}) {
        std::vector<double> place = {0, 0};
        const double least = patternSearch(bowl, place, {4, 1}, halvings);
        EXPECT_EQ((std::vector<double>{x, y}), place) << halvings;
        EXPECT_EQ(bowl(place), least);
    }
}

} // namespace
