#include "plot/plot.h"

#include "maths/median.h"
#include "metrics/tMeasured.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <iterator>
#include <limits>

namespace dravikHost {

namespace {

constexpr size_t kMostPoints = 4000; // more could not be told apart

bool endsWith(const std::string& text, std::string_view end)
{
    return text.size() > end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

double errorOf(const tRecordedPair& pair) { return pair.trueErrorNs.value_or(pair.errorNs); }

// Text in quotes, as gnuplot reads it verbatim.
std::string quoted(const std::string& text)
{
    std::string result = "'";
    for (const char c : text)
        result += c == '\'' ? std::string("''") : std::string(1, c);
    return result + "'";
}

void addRow(std::string& rows, const tRecordedPair& pair)
{
    const double nan = std::nan("");
    fmt::format_to(std::back_inserter(rows), "{:.9g} {:.6g} {:.9g} {}\n", secondsOf(pair.elapsedNs),
                   errorOf(pair), pair.orderedPpb.value_or(nan) / 1e3,
                   pair.locked.value_or(true) ? 0 : 1);
}

// Of a long trace the least and the largest error of each stretch, in their order.
std::string dataText(const std::vector<tRecordedPair>& pairs)
{
    std::string rows;
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
        addRow(rows, leastFirst ? *extremes.first : *extremes.second);
        if (extremes.first != extremes.second)
            addRow(rows, leastFirst ? *extremes.second : *extremes.first);
    }
    return rows;
}

// The typical error, which the axis shows in a straight scale; what is beyond is logarithmic.
double typicalErrorNs(const std::vector<tRecordedPair>& pairs)
{
    std::vector<double> errors;
    errors.reserve(pairs.size());
    for (const tRecordedPair& pair : pairs)
        errors.push_back(std::fabs(errorOf(pair)));
    return std::max(median(std::move(errors)), 0.1);
}

// Decades, from the typical error on, up to minutes.
std::string tics(double typicalNs)
{
    constexpr const char* kUnits[] = {"ns", "µs", "ms", "s"};
    std::string list = "\"0\" 0";
    for (int decade = std::max(0, static_cast<int>(std::ceil(std::log10(typicalNs)))); decade < 12;
         ++decade) {
        const int value = decade % 3 == 0 ? 1 : decade % 3 == 1 ? 10 : 100;
        const std::string label = fmt::format("{} {}", value, kUnits[decade / 3]);
        list += fmt::format(", \"{}\" 1e{}, \"-{}\" -1e{}", label, decade, label, decade);
    }
    return list;
}

std::string headText(const tRecording& recording, const std::string& file, int rows)
{
    const std::string size = fmt::format("size 1100,{} background '#ffffff'", 100 + 300 * rows);
    const std::string terminal =
        endsWith(file, ".svg") ? "svg dynamic " + size : "pngcairo " + size;
    return fmt::format("set terminal {} font 'sans,11' noenhanced\n"
                       "set output {}\n"
                       "$pairs << END\n{}END\n"
                       "set grid xtics ytics front lc rgb '#cccccc'\n"
                       "set style fill solid noborder\n"
                       "set y2range [0:1]\n"
                       "set key top right\n"
                       "set lmargin 11\n"
                       "shade = '#ffe8b3'\n",
                       terminal, quoted(file), dataText(recording.pairs));
}

std::string phaseText(const tRecording& recording)
{
    const bool isTrue = recording.pairs.front().trueErrorNs.has_value();
    const double typicalNs = typicalErrorNs(recording.pairs);
    return fmt::format("set title {}\n"
                       "set nonlinear y via asinh(y/{:.3g}) inverse {:.3g}*sinh(y)\n"
                       "set ytics ({})\n"
                       "plot $pairs using 1:4 axes x1y2 with fillsteps lc rgb shade title 'not "
                       "locked', \\\n"
                       "    '' using 1:2 with lines lc rgb '#1f6feb' title 'clock - {}'\n"
                       "unset nonlinear y\n"
                       "set ytics auto\n",
                       quoted("Phase error, " + recording.name), typicalNs, typicalNs,
                       tics(typicalNs), isTrue ? "true time" : "reference, as measured");
}

// Once locked, what is ordered moves by much less than from the start to there.
std::string frequencyRange(const std::vector<tRecordedPair>& pairs)
{
    double lowest = std::numeric_limits<double>::infinity();
    double highest = -lowest;
    for (const tRecordedPair& pair : pairs) {
        if (!pair.locked.value_or(true) || !pair.orderedPpb) continue;
        lowest = std::min(lowest, *pair.orderedPpb / 1e3);
        highest = std::max(highest, *pair.orderedPpb / 1e3);
    }
    if (!(lowest < highest)) return "";
    const double margin = (highest - lowest) / 10;
    return fmt::format("set yrange [{:.6g}:{:.6g}]\n", lowest - margin, highest + margin);
}

std::string frequencyText(const std::vector<tRecordedPair>& pairs)
{
    return frequencyRange(pairs) +
           "set title 'Frequency'\n"
           "set ylabel 'ppm'\n"
           "set xlabel 's'\n"
           "plot $pairs using 1:4 axes x1y2 with fillsteps lc rgb shade notitle, \\\n"
           "    '' using 1:3 with steps lc rgb '#d1242f' title 'offset ordered'\n"
           "set yrange [*:*]\n";
}

} // namespace

bool isPictureName(const std::string& file)
{
    return endsWith(file, ".svg") || endsWith(file, ".png");
}

std::string plotScript(const tRecording& recording, const tPlotOptions& options)
{
    const auto& pairs = recording.pairs;
    const bool hasFrequency =
        std::any_of(pairs.begin(), pairs.end(),
                    [](const tRecordedPair& pair) { return pair.orderedPpb.has_value(); });
    const tSeries series = measure(recording, {}).series;
    const int rows = 1 + (hasFrequency ? 1 : 0) + (hasStability(series) ? 1 : 0);
    const double height = 1.0 / rows;
    std::string script = headText(recording, options.picture, rows) + "set multiplot\n";
    script += fmt::format("set size 1,{:.3f}\nset origin 0,{:.3f}\n", height, 1 - height);
    script += phaseText(recording);
    script += fmt::format("set origin 0,{:.3f}\n", 1 - 2 * height);
    if (hasFrequency) script += frequencyText(pairs);
    if (hasStability(series)) script += stabilityPanels(series, options.mask, {0, height});
    return script + "unset multiplot\n";
}

} // namespace dravikHost
