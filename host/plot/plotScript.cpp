#include "plot/plot.h"

#include "metrics/tMeasured.h"
#include "plot/timePanels.h"

#include <fmt/format.h>

#include <algorithm>

namespace dravikHost {

namespace {

bool endsWith(const std::string& text, std::string_view end)
{
    return text.size() > end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

std::string headText(const tRecording& recording, const std::string& file, int rows)
{
    const std::string size = fmt::format("size 1100,{} background '#ffffff'", 100 + 300 * rows);
    const std::string terminal =
        endsWith(file, ".svg") ? "svg dynamic " + size : "pngcairo " + size;
    return fmt::format("set terminal {} font 'sans,11' noenhanced\n"
                       "set output {}\n"
                       "{}"
                       "set grid xtics ytics back lt 1 lc rgb '#d0d0d0'\n"
                       "set style fill solid noborder\n"
                       "set y2range [0:1]\n"
                       "set key at graph 1,1.1 right horizontal samplen 3\n"
                       "set title offset 0,0.8\n"
                       "set lmargin 14\n",
                       terminal, quoted(file), pairsBlock(recording.pairs));
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
    script += phasePanel(recording);
    script += fmt::format("set origin 0,{:.3f}\n", 1 - 2 * height);
    if (hasFrequency) script += frequencyPanel(pairs);
    if (hasStability(series)) script += stabilityPanels(series, options.mask, {0, height});
    return script + "unset multiplot\n";
}

} // namespace dravikHost
