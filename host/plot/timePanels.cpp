#include "plot/timePanels.h"

#include "maths/median.h"
#include "plot/plot.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <iterator>
#include <limits>

namespace dravikHost {

namespace {

constexpr size_t kMostPoints = 4000; // more could not be told apart
constexpr double kFar = 10;          // typical errors, which noise alone does not reach

using tPairs = std::vector<tRecordedPair>;
using tValue = std::function<std::optional<double>(const tRecordedPair& pair)>;

struct tSpan {
    double lowest = std::numeric_limits<double>::infinity();
    double highest = -lowest;

    void take(double value)
    {
        lowest = std::min(lowest, value);
        highest = std::max(highest, value);
    }
    bool holds(double value) const { return value >= lowest && value <= highest; }
    double farthest() const { return std::max(std::fabs(lowest), std::fabs(highest)); }
    tSpan withMargin() const
    {
        const double margin =
            lowest < highest ? (highest - lowest) / 10 : std::max(std::fabs(highest) / 10, 1.0);
        return {lowest - margin, highest + margin};
    }
};

double errorOf(const tRecordedPair& pair) { return pair.trueErrorNs.value_or(pair.errorNs); }

bool isLocked(const tRecordedPair& pair) { return pair.locked.value_or(true); }

struct tTimeUnit {
    const char* name;
    double seconds;
};

tTimeUnit timeUnit(const tPairs& pairs)
{
    constexpr double kHour = 3600;
    const double seconds = secondsOf(pairs.back().elapsedNs);
    if (seconds < 5 * kHour) return {"s", 1};
    return seconds < 120 * kHour ? tTimeUnit{"h", kHour} : tTimeUnit{"d", 24 * kHour};
}

void addRow(std::string& rows, const tRecordedPair& pair, const tTimeUnit& unit)
{
    fmt::format_to(std::back_inserter(rows), "{:.9g} {:.12g} {:.9g} {}\n",
                   secondsOf(pair.elapsedNs) / unit.seconds, errorOf(pair),
                   pair.orderedPpb.value_or(std::nan("")), isLocked(pair) ? 0 : 1);
}

double typicalErrorNs(const tPairs& pairs)
{
    std::vector<double> errors;
    errors.reserve(pairs.size());
    for (const tRecordedPair& pair : pairs)
        errors.push_back(std::fabs(errorOf(pair)));
    return std::max(median(std::move(errors)), 0.1);
}

// Where the start is over: locked, and no longer far off. A start that takes a good part of the
// trace is what the trace is about.
tPairs::const_iterator afterStart(const tPairs& pairs, double typicalNs)
{
    const auto settled =
        std::find_if(pairs.begin(), pairs.end(), [typicalNs](const tRecordedPair& pair) {
            return isLocked(pair) && std::fabs(errorOf(pair)) <= kFar * typicalNs;
        });
    const auto start = static_cast<size_t>(settled - pairs.begin());
    return start > pairs.size() / 4 ? pairs.begin() : settled;
}

// In words, what an axis of that span cuts off; "" if nothing.
std::string cutOffText(const tPairs& pairs, const tSpan& shown, const tValue& value,
                       std::string (*text)(double))
{
    int64_t count = 0;
    tSpan times;
    tSpan values;
    for (const tRecordedPair& pair : pairs) {
        const std::optional<double> found = value(pair);
        if (!found || shown.holds(*found)) continue;
        ++count;
        times.take(secondsOf(pair.elapsedNs));
        values.take(*found);
    }
    if (count == 0) return "";
    const std::string when = count == 1 ? "at" : fmt::format("from {:.3g} s to", times.lowest);
    std::string note = fmt::format("cut off: {} of {} points, {} {:.3g} s", count, pairs.size(),
                                   when, times.highest);
    if (values.highest > shown.highest) note += ", up to " + text(values.highest);
    if (values.lowest < shown.lowest) note += ", down to " + text(values.lowest);
    return note;
}

std::string noteText(const std::string& note)
{
    return fmt::format("set label 1 '{}' at graph 0,1.05 left font ',10'\n", note);
}

std::string rangeText(const tSpan& span, double unit)
{
    return fmt::format("set yrange [{:.12g}:{:.12g}]\n", span.lowest / unit, span.highest / unit);
}

// Begins a plot: where it was not locked is shaded, behind the curve and the grid.
std::string bandsText(const tPairs& pairs, const char* title)
{
    if (std::all_of(pairs.begin(), pairs.end(), isLocked)) return "plot $pairs";
    return fmt::format("plot $pairs using 1:4 axes x1y2 with fillsteps lc rgb '#80ffc440' {}, \\\n"
                       "    ''",
                       title);
}

struct tUnitOfError {
    const char* name;
    double ns;
};
constexpr tUnitOfError kUnits[] = {{"s", 1e9}, {"ms", 1e6}, {"µs", 1e3}, {"ns", 1}};

tUnitOfError unitOf(double ns)
{
    for (const tUnitOfError& unit : kUnits)
        if (ns >= unit.ns) return unit;
    return {"ns", 1};
}

std::string roundText(double ns)
{
    const tUnitOfError unit = unitOf(std::fabs(ns));
    return fmt::format("{:.3g} {}", ns / unit.ns, unit.name);
}

// Marks of an axis of both signs from the typical error on, the last one at or beyond the farthest:
// decades, or where there are but two of them 1, 2 and 5 of each.
std::vector<double> marksUpTo(double farthestNs, double typicalNs)
{
    const bool isWide = farthestNs > 100 * typicalNs;
    const double leastNs = isWide ? 3 * typicalNs : typicalNs; // labels need room
    std::vector<double> marks;
    double decade = std::pow(10, std::floor(std::log10(leastNs)));
    while (true) {
        for (const double mark : {1.0, 2.0, 5.0}) {
            if ((isWide && mark > 1) || mark * decade < leastNs) continue;
            marks.push_back(mark * decade);
            if (marks.back() >= farthestNs) return marks;
        }
        decade *= 10;
    }
}

// Both the noise and what is far beyond it on one axis.
std::string wideAxis(const std::vector<double>& marks, double typicalNs)
{
    std::string tics = "\"0\" 0";
    for (const double mark : marks) {
        const std::string label = roundText(mark);
        tics += fmt::format(", \"{}\" {:g}, \"-{}\" {:g}", label, mark, label, -mark);
    }
    return fmt::format("set nonlinear y via asinh(y/{:.3g}) inverse {:.3g}*sinh(y)\n"
                       "set ytics ({})\n"
                       "set ylabel \"phase error, linear\\nwithin ±{}\"\n",
                       typicalNs, typicalNs, tics, roundText(typicalNs));
}

std::string errorAxis(const tPairs& pairs, tUnitOfError& unit)
{
    const double typicalNs = typicalErrorNs(pairs);
    tSpan span;
    std::for_each(afterStart(pairs, typicalNs), pairs.end(),
                  [&span](const tRecordedPair& pair) { span.take(errorOf(pair)); });
    std::string axis;
    if (span.farthest() > kFar * typicalNs) {
        const std::vector<double> marks = marksUpTo(span.farthest(), typicalNs);
        span = {-marks.back(), marks.back()};
        axis = wideAxis(marks, typicalNs);
    } else {
        span = span.withMargin();
        unit = unitOf(span.farthest());
        axis = fmt::format("set ylabel 'phase error, {}'\n", unit.name);
    }
    return axis + rangeText(span, unit.ns) + noteText(cutOffText(pairs, span, errorOf, roundText));
}

std::string xAxis(const tPairs& pairs)
{
    return fmt::format("set xlabel 'time, {}'\n", timeUnit(pairs).name);
}

std::string ppmText(double ppb) { return fmt::format("{:.4g} ppm", ppb / 1e3); }

// Once locked, what is ordered moves by much less than from the start to there.
tSpan frequencySpan(const tPairs& pairs)
{
    tSpan all;
    tSpan settled;
    const auto started = afterStart(pairs, typicalErrorNs(pairs));
    for (auto pair = pairs.begin(); pair != pairs.end(); ++pair) {
        if (!pair->orderedPpb) continue;
        all.take(*pair->orderedPpb);
        if (pair >= started && isLocked(*pair)) settled.take(*pair->orderedPpb);
    }
    return (settled.lowest <= settled.highest ? settled : all).withMargin();
}

} // namespace

std::string quoted(const std::string& text)
{
    std::string result = "'";
    for (const char c : text)
        result += c == '\'' ? std::string("''") : std::string(1, c);
    return result + "'";
}

// Of a long trace the least and the largest error of each stretch, in their order.
std::string pairsBlock(const tPairs& pairs)
{
    std::string rows;
    const tTimeUnit unit = timeUnit(pairs);
    const size_t stretch = (pairs.size() + kMostPoints - 1) / kMostPoints;
    const auto less = [](const tRecordedPair& one, const tRecordedPair& other) {
        return errorOf(one) < errorOf(other);
    };
    for (size_t start = 0; start < pairs.size(); start += stretch) {
        const auto first = pairs.begin() + static_cast<std::ptrdiff_t>(start);
        const auto end =
            first + static_cast<std::ptrdiff_t>(std::min(stretch, pairs.size() - start));
        const auto extremes = std::minmax_element(first, end, less);
        const bool leastFirst = extremes.first < extremes.second;
        addRow(rows, leastFirst ? *extremes.first : *extremes.second, unit);
        if (extremes.first != extremes.second)
            addRow(rows, leastFirst ? *extremes.second : *extremes.first, unit);
    }
    return "$pairs << END\n" + rows + "END\n";
}

std::string phasePanel(const tRecording& recording)
{
    const bool isTrue = recording.pairs.front().trueErrorNs.has_value();
    tUnitOfError unit = {"ns", 1};
    const std::string axis = errorAxis(recording.pairs, unit);
    return axis + xAxis(recording.pairs) +
           fmt::format("set title {}\n{}"
                       " using 1:($2/{:g}) with lines lc rgb '#1f6feb' title 'clock - {}'\n"
                       "unset nonlinear y\n"
                       "set yrange [*:*]\n"
                       "set ytics auto\n"
                       "unset label\n",
                       quoted("Phase error, " + recording.name),
                       bandsText(recording.pairs, "title 'not locked'"), unit.ns,
                       isTrue ? "true time" : "reference, as measured");
}

std::string frequencyPanel(const tPairs& pairs)
{
    const tSpan span = frequencySpan(pairs);
    const auto ordered = [](const tRecordedPair& pair) { return pair.orderedPpb; };
    const bool isSmall = span.farthest() < 1000;
    const double unit = isSmall ? 1 : 1000;
    return rangeText(span, unit) + noteText(cutOffText(pairs, span, ordered, ppmText)) +
           fmt::format("set title 'Frequency'\n"
                       "set ylabel 'frequency, {}'\n"
                       "set format y '%.9g'\n"
                       "{}"
                       " using 1:($3/{}) with steps lc rgb '#d1242f' title 'offset ordered'\n"
                       "set yrange [*:*]\n"
                       "unset label\n",
                       isSmall ? "ppb" : "ppm", bandsText(pairs, "notitle"), unit);
}

} // namespace dravikHost
