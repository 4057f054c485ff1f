#include "verbs/verbs.h"

#include "metrics/masks.h"
#include "plot/plot.h"
#include "text/files.h"
#include "verbs/shared.h"

#include <memory>
#include <stdexcept>

namespace dravikHost {

namespace {

struct tPlot {
    tTraceOptions trace;
    tPlotOptions plot;
    std::string script; // "": none; "-": stdout
};

void run(const tPlot& options)
{
    const std::string script = plotScript(readTrace(options.trace), options.plot);
    if (options.script.empty()) {
        const tOutputFile writable(
            options.plot.picture); // or gnuplot would take the standard output
        runGnuplot(script);
        return;
    }
    writeText(options.script, script);
}

// Other masks limit single figures only.
std::vector<std::string> curvedMaskNames()
{
    std::vector<std::string> names;
    for (const std::string& name : maskNames())
        if (!maskCurves(name).empty()) names.push_back(name);
    return names;
}

void requirePictureName(const std::string& file)
{
    if (!isPictureName(file))
        throw std::invalid_argument("'" + file + "' does not end in .svg or .png");
}

} // namespace

std::function<void()> addPlot(tOptionSet& options)
{
    const auto plot = std::make_shared<tPlot>();
    addTraceOptions(options, plot->trace).require();
    options
        .parsed(
            "-o,--output", "FILE",
            [plot](const std::string& file) {
                requirePictureName(file);
                plot->plot.picture = file;
            },
            "The picture; its ending, .svg or .png,\nsays what kind")
        .require();
    options
        .text("--mask", "NAME", plot->plot.mask,
              "Limits beside the stability curves, as of metrics")
        .oneOf(curvedMaskNames());
    options.text("--script", "FILE", plot->script,
                 "Write the script for gnuplot instead; - is\nstdout");
    return [plot] { run(*plot); };
}

} // namespace dravikHost
