#include "metrics/figures.h"

#include "metrics/stability.h"
#include "text/quantity.h"
#include "text/words.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <stdexcept>

namespace dravikHost {

namespace {

struct tPlain {
    const char* name;
    bool isTime;
    std::optional<double> (*value)(const tMeasured&);
};
constexpr tPlain kPlain[] = {
    {"rms", true, [](const tMeasured& m) { return std::optional(m.rms()); }},
    {"peak", true, [](const tMeasured& m) { return std::optional(m.peak()); }},
    {"peak-to-peak", true, [](const tMeasured& m) { return std::optional(m.peakToPeak()); }},
    {"mean", true, [](const tMeasured& m) { return std::optional(m.mean()); }},
    {"time-to-lock", true, [](const tMeasured& m) { return m.timeToLock; }},
    {"locks-lost", false,
     [](const tMeasured& m) {
         return m.locksLost ? std::optional(static_cast<double>(*m.locksLost)) : std::nullopt;
     }},
};

struct tOverTau {
    const char* name;
    bool isTime;
    std::optional<double> tStability::*value;
};
constexpr tOverTau kOverTau[] = {
    {"adev", false, &tStability::adev}, {"oadev", false, &tStability::oadev},
    {"mdev", false, &tStability::mdev}, {"tdev", true, &tStability::tdev},
    {"mtie", true, &tStability::mtie},
};

template <typename Row, size_t size>
const Row* find(const Row (&rows)[size], const std::string& name)
{
    const Row* const row = std::find_if(
        rows, rows + size, [&name](const Row& candidate) { return name == candidate.name; });
    return row == rows + size ? nullptr : row;
}

} // namespace

tFigure parseFigure(const std::string& text)
{
    const size_t open = text.find('(');
    const std::string name = text.substr(0, open);
    const tPlain* const plain = find(kPlain, name);
    const tOverTau* const overTau = find(kOverTau, name);
    if (open == std::string::npos && plain != nullptr) return {name, 0, plain->isTime};
    if (open != std::string::npos && text.back() == ')' && overTau != nullptr) {
        const std::string tau = text.substr(open + 1, text.size() - open - 2);
        return {name, secondsOf(parseQuantity(tau, kDuration)), overTau->isTime};
    }
    throw std::invalid_argument(fmt::format(
        "'{}' is none of rms, peak, peak-to-peak, mean, time-to-lock, locks-lost, nor adev, oadev, "
        "mdev, tdev or mtie with its tau, as in tdev(10s)",
        text));
}

std::optional<double> valueOf(const tFigure& figure, const tMeasured& measured)
{
    constexpr double kInexact = 1e-3;     // of tau, as moments may be rounded; less than ...
    constexpr double kMostInexact = 0.25; // ... of an interval
    const tPlain* const plain = find(kPlain, figure.name);
    if (plain != nullptr) return plain->value(measured);
    const tOverTau* const overTau = find(kOverTau, figure.name);
    if (overTau == nullptr || measured.series.phase.size() < 2) return std::nullopt;
    const double n = figure.tau / measured.series.interval;
    const auto points = static_cast<double>(measured.series.phase.size());
    const double tolerance = std::min(kInexact * std::max(n, 1.0), kMostInexact);
    if (std::round(n) < 1 || n >= points || std::fabs(n - std::round(n)) > tolerance)
        return std::nullopt;
    return stabilityAt(measured.series, static_cast<size_t>(std::llround(n))).*overTau->value;
}

tAssertion::tAssertion(const std::string& text) : text(text)
{
    const size_t at = text.find_first_of("<>");
    if (at == std::string::npos)
        throw std::invalid_argument(fmt::format("'{}' is not FIGURE<LIMIT", text));
    figure = parseFigure(text.substr(0, at));
    less = text[at] == '<';
    orEqual = text.compare(at + 1, 1, "=") == 0;
    const std::string value = text.substr(at + (orEqual ? 2 : 1));
    if (figure.isTime) {
        limit = secondsOf(parseQuantity(value, kDuration));
        return;
    }
    const auto number = numberIn<double>(value);
    if (!number) throw std::invalid_argument(fmt::format("'{}' is not a plain number", value));
    limit = *number;
}

std::string tAssertion::failure(const tMeasured& measured) const
{
    const auto found = valueOf(figure, measured);
    if (!found) return fmt::format("{} cannot be computed from these data", text);
    const bool holds = (less ? *found < limit : *found > limit) || (orEqual && *found == limit);
    if (holds) return "";
    return fmt::format("{} does not hold: it is {}", text,
                       figure.isTime ? durationText(nsOf(*found)) : fmt::format("{:.4g}", *found));
}

} // namespace dravikHost
