#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace dravikHost {

constexpr int64_t kSecondNs = 1'000'000'000;

// Timestamps are in nanoseconds, control laws and statistics in seconds.
template <typename Number> constexpr double secondsOf(Number ns)
{
    return static_cast<double>(ns) * 1e-9;
}
constexpr double nsOf(double seconds) { return seconds * 1e9; }

// A kind of quantity: its units as the command line takes them, and their size in the base unit.
struct tUnit {
    const char* name;
    double size; // 0 ends the list
};
struct tQuantityKind {
    const char* placeholder; // in the help
    tUnit units[7];
};

extern const tQuantityKind kDuration;  // base unit: ns
extern const tQuantityKind kFrequency; // base unit: ppb
extern const tQuantityKind kRatio;     // base unit: 1
extern const tQuantityKind kBandwidth; // base unit: Hz
extern const tQuantityKind kGain;      // base unit: dB

// Reads a number with its unit, as in "125ms", "-12ppm", "1%", whatever the locale; only 0 may
// stand alone. Throws std::invalid_argument that tells what is wrong.
double parseQuantity(std::string_view text, const tQuantityKind& kind);

// For people: "1.012 ms", "+11.980 ppm", "2.125" (seconds). What rounds to zero is "0 ns" or
// "+0 ns", never -0; what is no number or infinite is "out of range".
std::string durationText(double ns);
std::string signedDurationText(double ns);
inline std::string durationText(int64_t ns) { return durationText(static_cast<double>(ns)); }
inline std::string signedDurationText(int64_t ns)
{
    return signedDurationText(static_cast<double>(ns));
}
std::string offsetText(double offsetPpb);
std::string decimalText(double value);           // as many decimals as it takes, up to six
std::string secondsText(int64_t ns, int digits); // not negative; cut, not rounded

} // namespace dravikHost
