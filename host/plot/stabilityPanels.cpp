#include "plot/plot.h"

#include "metrics/masks.h"
#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <iterator>

namespace dravikHost {

namespace {

double nsOrNan(std::optional<double> seconds) { return nsOf(seconds.value_or(std::nan(""))); }

// One line for each tau: tau in s, TDEV and MTIE in ns, ADEV and MDEV.
std::string rowsOf(const char* block, const tSeries& series)
{
    std::string text = fmt::format("${} << END\n", block);
    for (const size_t n : octaves(series)) {
        const tStability at = stabilityAt(series, n);
        fmt::format_to(std::back_inserter(text), "{:g} {:.4g} {:.4g} {:.4g} {:.4g}\n",
                       static_cast<double>(n) * series.interval, nsOrNan(at.tdev), nsOrNan(at.mtie),
                       at.adev.value_or(std::nan("")), at.mdev.value_or(std::nan("")));
    }
    return text + "END\n";
}

constexpr const char* kTdevColour = "#1f6feb";
constexpr const char* kMtieColour = "#8250df";

// The curve once more where the limit is of the filtered error, and the limit.
std::string limitText(const tMaskCurve& curve)
{
    const bool isTdev = curve.figure == &tStability::tdev;
    const char* const colour = isTdev ? kTdevColour : kMtieColour;
    std::string text;
    if (curve.lowPassed) {
        text += fmt::format(", \\\n    $filtered using 1:{} with lines lw 2 lc rgb '{}' title "
                            "'filtered {}'",
                            isTdev ? 2 : 3, colour, curve.title);
    }
    const double slope =
        std::log(curve.toNs / curve.fromNs) / std::log(curve.toTau / curve.fromTau);
    return text + fmt::format(", \\\n    [{:g}:{:g}] {:g}*(x/{:g})**{:g} with lines dt 2 lw 2 lc "
                              "rgb '{}' title 'limit of {}'",
                              curve.fromTau, curve.toTau, curve.fromNs, curve.fromTau, slope,
                              colour, curve.title);
}

bool hasFilteredLimit(const std::vector<tMaskCurve>& curves)
{
    return std::any_of(curves.begin(), curves.end(),
                       [](const tMaskCurve& curve) { return curve.lowPassed; });
}

std::string halfText(int half, const tPanelRow& row)
{
    return fmt::format("set origin {:g},{:.3f}\nset size 0.5,{:.3f}\n", 0.5 * half, row.bottom,
                       row.height);
}

// From a decade on, and up to another one at least, for there are no labels between.
std::string tauRange(const tSeries& series)
{
    const double lowest = std::pow(10, std::floor(std::log10(series.interval)));
    const double highest = static_cast<double>(octaves(series).back()) * series.interval;
    return fmt::format("set xrange [{:.3g}:{:.6g}]\n", lowest / 1.1,
                       std::max(1.1 * highest, 10 * lowest));
}

} // namespace

bool hasStability(const tSeries& series)
{
    return !octaves(series).empty() && stabilityAt(series, 1).mtie > 0;
}

std::string stabilityPanels(const tSeries& series, const std::string& mask, const tPanelRow& row)
{
    const auto curves = mask.empty() ? std::vector<tMaskCurve>() : maskCurves(mask);
    std::string text = rowsOf("stability", series);
    if (hasFilteredLimit(curves)) text += rowsOf("filtered", behindMaskFilter(series));
    text += "set logscale xy\nset title offset 0,0\n"
            "set key default bmargin center horizontal samplen 3 width 2\n"
            "set xlabel 'averaging time tau, s' offset 0,0.6\n";
    text += tauRange(series);
    text += halfText(0, row);
    text += fmt::format("set title 'Stability of the phase{}'\nset ylabel 'TDEV and MTIE, ns'\n"
                        "set format y '%g'\n"
                        "plot $stability using 1:2 with linespoints pt 7 ps 0.4 lc rgb '{}' title "
                        "'TDEV', \\\n    '' using 1:3 with linespoints pt 7 ps 0.4 lc rgb '{}' "
                        "title 'MTIE'",
                        mask.empty() ? "" : ", mask " + mask, kTdevColour, kMtieColour);
    for (const tMaskCurve& curve : curves)
        text += limitText(curve);
    text += "\n" + halfText(1, row);
    return text + "set title 'Stability of the frequency'\nset ylabel 'fractional frequency, s/s'\n"
                  "set format y '%.0e'\n"
                  "plot $stability using 1:4 with linespoints pt 7 ps 0.4 lc rgb '#d1242f' title "
                  "'ADEV', \\\n    '' using 1:5 with linespoints pt 7 ps 0.4 lc rgb '#9a6700' "
                  "title 'MDEV'\n";
}

} // namespace dravikHost
