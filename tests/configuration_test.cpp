// The tuning parameters: defaults, bounds, and the limits from the host.

#include "support/tFakeHost.h"
#include "zverr/Exception.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>

namespace {

using zvckmDravik::iServoConfig;

// What a setter raises: code and payload; "" for nothing.
std::string refusalOf(const std::function<void()>& call)
{
    try {
        call();
    } catch (const zverr::Exception& failure) {
        expectBufferForm(failure.status);
        return std::to_string(failure.status.code) + " " + failure.what();
    }
    return "";
}

std::string refusalAt(int line)
{
    return R"(-52005 {"error_constant":"zvplaterr_invalidParameter","file":"dravik/tServo","line":)" +
           std::to_string(line) + R"(,"component":"dravik"})";
}

TEST(Parameters, DoublesHaveDefaultsAndInclusiveBounds)
{
    struct Row {
        const char* name;
        double (iServoConfig::*get)() const;
        void (iServoConfig::*set)(double);
        double initial, lowest, highest;
        int line;
    };
#define PARAMETER(name, initial, lowest, highest, line)                                            \
    {                                                                                              \
#name, &iServoConfig::get##name, &iServoConfig::set##name, initial, lowest, highest, line  \
    }
    const Row rows[] = {
        PARAMETER(FrequencyLockGain, 1.0, 1e-9, 10.0, 77),
        PARAMETER(PhaseLockGain, 0.55, 1e-9, 10.0, 98),
        PARAMETER(PhaseLockCoefficientA, 2.0, -10.0, 10.0, 119),
        PARAMETER(PhaseLockCoefficientB, 1.0, -10.0, 10.0, 140),
        PARAMETER(PhaseLockCoefficientC, 1.0, -10.0, 10.0, 161),
        PARAMETER(SnapTimeThreshold, 1e-6, 1e-8, 10.0, 182),
        PARAMETER(SpikeFilterMaxThreshold, 1.0, 1e-9, 10.0, 256),
        PARAMETER(SpikeFilterMinThreshold, 2.5e-8, 1e-9, 10.0, 277),
        PARAMETER(SpikeFilterGrowthFactor, 3.0, 1.001, 100.0, 298),
    };
#undef PARAMETER
    const double infinity = std::numeric_limits<double>::infinity();
    tFakeHost host;
    iServoConfig& config = host.open().config();
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(row.initial, (config.*row.get)());
        for (const double good : {row.lowest, row.highest}) {
            EXPECT_EQ("", refusalOf([&] { (config.*row.set)(good); }));
            EXPECT_EQ(good, (config.*row.get)());
        }
        for (const double bad :
             {std::nextafter(row.lowest, -infinity), std::nextafter(row.highest, infinity),
              -infinity, infinity, std::nan("")}) {
            EXPECT_EQ(refusalAt(row.line), refusalOf([&] { (config.*row.set)(bad); })) << bad;
            EXPECT_EQ(row.highest, (config.*row.get)()) << "a refused value changes nothing";
        }
    }
    EXPECT_EQ("", refusalOf([&] { config.setPhaseLockCoefficientB(0.0); }));
    EXPECT_EQ(refusalAt(77), refusalOf([&] { config.setFrequencyLockGain(0.0); }));
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
        EXPECT_EQ("", refusalOf([&] { config.setSpikeFilterHistorySize(good); }));
    }
    for (const uint32_t bad : {0U, 1U, 101U, static_cast<uint32_t>(-5)}) {
        EXPECT_EQ(refusalAt(235), refusalOf([&] { config.setSpikeFilterHistorySize(bad); })) << bad;
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
