#include "text/quantity.h"

#include <gtest/gtest.h>

#include <stdexcept>

using namespace dravikHost;

namespace {

struct tQuantityRow {
    const char* text;
    const tQuantityKind& kind;
    double value;
};
const tQuantityRow kQuantities[] = {
    {"125ms", kDuration, 125e6}, {"-12ppm", kFrequency, -12e3}, {"1%", kRatio, 0.01},
    {"+3us", kDuration, 3e3},    {"2min", kDuration, 120e9},    {"1e-3h", kDuration, 3.6e9},
    {"0", kFrequency, 0},        {"7ppb", kFrequency, 7},       {"1.5s", kDuration, 1.5e9},
};

TEST(Quantity, isReadInItsBaseUnit)
{
    for (const tQuantityRow& row : kQuantities)
        EXPECT_DOUBLE_EQ(row.value, parseQuantity(row.text, row.kind)) << row.text;
    for (const char* const text : {"", "5", "5ppm", "s", "nan", "1e999s", "+-1s", "1,5s", "1 s"})
        EXPECT_THROW(parseQuantity(text, kDuration), std::invalid_argument) << text;
}

} // namespace
