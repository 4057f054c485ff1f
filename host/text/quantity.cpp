#include "text/quantity.h"

#include <fmt/format.h>

#include <charconv>
#include <cmath>
#include <stdexcept>

namespace dravikHost {

const tQuantityKind kDuration = {
    "TIME", {{"ns", 1}, {"us", 1e3}, {"ms", 1e6}, {"s", 1e9}, {"min", 60e9}, {"h", 3600e9}, {}}};
const tQuantityKind kFrequency = {"OFFSET", {{"ppb", 1}, {"ppm", 1e3}, {}}};
const tQuantityKind kRatio = {"PERCENT", {{"%", 0.01}, {}}};
const tQuantityKind kBandwidth = {"BANDWIDTH", {{"mHz", 1e-3}, {"Hz", 1}, {}}};
const tQuantityKind kGain = {"GAIN", {{"dB", 1}, {}}};

namespace {

[[noreturn]] void refuse(std::string_view text, std::string_view why)
{
    throw std::invalid_argument(fmt::format("'{}' {}", text, why));
}

// "ns, us or ms"
std::string unitList(const tQuantityKind& kind)
{
    std::string list = kind.units[0].name;
    for (const tUnit* unit = kind.units + 1; unit->size != 0; ++unit)
        list += fmt::format("{}{}", unit[1].size != 0 ? ", " : " or ", unit->name);
    return list;
}

// Splits the number off the text.
double takeNumber(std::string_view& rest)
{
    const std::string_view text = rest;
    if (rest.size() > 1 && rest[0] == '+' && rest[1] != '-') rest.remove_prefix(1);
    double number = 0;
    const auto result = std::from_chars(rest.data(), rest.data() + rest.size(), number);
    if (result.ec == std::errc::result_out_of_range) refuse(text, "is out of range");
    if (result.ec != std::errc() || !std::isfinite(number))
        refuse(text, "does not start with a number");
    rest.remove_prefix(static_cast<size_t>(result.ptr - rest.data()));
    return number;
}

// Less is a rounding of sums: no clock is compared to that.
constexpr double kTinyNs = 1e-7;
constexpr double kPicosecondNs = 1e-3;
constexpr double kWholeSecondsNs = 9999.5e9; // from here on four digits would cut seconds
constexpr double kManySecondsNs = 1e24;

std::string inFittingUnit(double ns, bool withSign)
{
    if (!std::isfinite(ns)) return "out of range";
    const double size = std::fabs(ns);
    if (size < kTinyNs) return withSign ? "+0 ns" : "0 ns";
    if (size < kPicosecondNs)
        return fmt::format(withSign ? "{:+.4g} ps" : "{:.4g} ps", ns / kPicosecondNs);
    if (size >= kWholeSecondsNs && size < kManySecondsNs)
        return fmt::format(withSign ? "{:+.0f} s" : "{:.0f} s", secondsOf(ns));
    const tUnit* unit = kDuration.units;
    while (unit[1].size <= kSecondNs && size >= unit[1].size) // up to seconds
        ++unit;
    return fmt::format(withSign ? "{:+.4g} {}" : "{:.4g} {}", ns / unit->size, unit->name);
}

} // namespace

double parseQuantity(std::string_view text, const tQuantityKind& kind)
{
    std::string_view rest = text;
    const double number = takeNumber(rest);
    if (rest.empty() && number == 0) return 0;
    if (rest.empty()) refuse(text, fmt::format("has no unit; use {}", unitList(kind)));
    for (const tUnit* unit = kind.units; unit->size != 0; ++unit)
        if (rest == unit->name) return number * unit->size;
    refuse(text, fmt::format("has an unknown unit '{}'; use {}", rest, unitList(kind)));
}

std::string durationText(double ns) { return inFittingUnit(ns, false); }

std::string signedDurationText(double ns) { return inFittingUnit(ns, true); }

std::string offsetText(double offsetPpb)
{
    if (!std::isfinite(offsetPpb)) return "out of range";
    constexpr double kHalfDigitPpb = 0.5;
    const double shown = std::fabs(offsetPpb) < kHalfDigitPpb ? 0 : offsetPpb;
    return fmt::format("{:+.3f} ppm", shown / 1e3);
}

std::string decimalText(double value)
{
    std::string text = fmt::format("{:.6f}", value);
    text.erase(text.find_last_not_of('0') + 1);
    if (text.back() == '.') text.pop_back();
    return text;
}

std::string secondsText(int64_t ns, int digits)
{
    const std::string text = fmt::format("{}.{:09}", ns / kSecondNs, ns % kSecondNs);
    return text.substr(0, text.size() - static_cast<size_t>(9 - digits));
}

} // namespace dravikHost
