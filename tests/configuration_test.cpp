// The tuning parameters: defaults, bounds, and the limits from the host.

#include "support/tFakeHost.h"
#include "zverr/Exception.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>

namespace {

using zvckmDravik::iServoConfig;

int32_t codeOf(const std::function<void()>& call)
{
    try {
        call();
    } catch (const zverr::Exception& failure) {
        return failure.status.code;
    }
    return 0;
}

TEST(Parameters, DoublesHaveDefaultsAndInclusiveBounds)
{
    struct Row {
        const char* name;
        double (iServoConfig::*get)() const;
        void (iServoConfig::*set)(double);
        double initial, lowest, highest;
    };
#define PARAMETER(name, initial, lowest, highest)                                                  \
    {                                                                                              \
#name, &iServoConfig::get##name, &iServoConfig::set##name, initial, lowest, highest        \
    }
    const Row rows[] = {
        PARAMETER(FrequencyLockGain, 1.0, 1e-9, 10.0),
        PARAMETER(PhaseLockGain, 0.55, 1e-9, 10.0),
        PARAMETER(PhaseLockCoefficientA, 2.0, -10.0, 10.0),
        PARAMETER(PhaseLockCoefficientB, 1.0, -10.0, 10.0),
        PARAMETER(PhaseLockCoefficientC, 1.0, -10.0, 10.0),
        PARAMETER(SnapTimeThreshold, 1e-6, 1e-8, 10.0),
        PARAMETER(SpikeFilterMaxThreshold, 1.0, 1e-9, 10.0),
        PARAMETER(SpikeFilterMinThreshold, 2.5e-8, 1e-9, 10.0),
        PARAMETER(SpikeFilterGrowthFactor, 3.0, 1.001, 100.0),
    };
#undef PARAMETER
    const double infinity = std::numeric_limits<double>::infinity();
    tFakeHost host;
    iServoConfig& config = host.open().config();
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(row.initial, (config.*row.get)());
        for (const double good : {row.lowest, row.highest}) {
            EXPECT_EQ(0, codeOf([&] { (config.*row.set)(good); }));
            EXPECT_EQ(good, (config.*row.get)());
        }
        for (const double bad :
             {std::nextafter(row.lowest, -infinity), std::nextafter(row.highest, infinity),
              -infinity, infinity, std::nan("")}) {
            EXPECT_EQ(-52005, codeOf([&] { (config.*row.set)(bad); })) << bad;
            EXPECT_EQ(row.highest, (config.*row.get)()) << "a refused value changes nothing";
        }
    }
    EXPECT_EQ(0, codeOf([&] { config.setPhaseLockCoefficientB(0.0); }));
    EXPECT_EQ(-52005, codeOf([&] { config.setFrequencyLockGain(0.0); }));
}

TEST(Parameters, FilterSwitchAndHistorySize)
{
    tFakeHost host;
    iServoConfig& config = host.open().config();
    EXPECT_FALSE(config.getSpikeFilterEnabled());
    config.setSpikeFilterEnabled(true);
    EXPECT_TRUE(config.getSpikeFilterEnabled());
    EXPECT_EQ(5U, config.getSpikeFilterHistorySize());
    for (const uint32_t good : {2U, 100U}) {
        EXPECT_EQ(0, codeOf([&] { config.setSpikeFilterHistorySize(good); }));
    }
    for (const uint32_t bad : {0U, 1U, 101U, static_cast<uint32_t>(-5)}) {
        EXPECT_EQ(-52005, codeOf([&] { config.setSpikeFilterHistorySize(bad); })) << bad;
    }
    EXPECT_EQ(100U, config.getSpikeFilterHistorySize());
}

TEST(Parameters, HostLimitsAreMultipliedByAPartPerBillion)
{
    tFakeHost host;
    host.maxPpb = 107919; // a division by 1e9 gives another last bit
    host.minPpb = -115838;
    iServoConfig& config = host.open().config();
    EXPECT_EQ(0x1.c4a524d6e8c95p-14, config.getMaxFrequencyOffset());
    EXPECT_EQ(-0x1.e5dc1afc0d5fdp-14, config.getMinFrequencyOffset());
}

} // namespace
