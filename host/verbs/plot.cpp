#include "verbs/plot.h"

#include "metrics/masks.h"
#include "plot/plotScript.h"
#include "plot/runGnuplot.h"
#include "text/tOutputFile.h"
#include "traces/traceOptions.h"

#include <memory>

namespace {

struct tOptions {
    tTraceOptions trace;
    tPlotOptions plot;
    std::string script; // "": none; "-": stdout
};

void plot(const tOptions& options)
{
    const std::string script = plotScript(readTrace(options.trace), options.plot);
    if (options.script.empty()) {
        const tOutputFile writable(
            options.plot.picture); // or gnuplot would take the standard output
        runGnuplot(script);
        return;
    }
    tOutputFile output = options.script == "-" ? tOutputFile(stdout, "the standard output")
                                               : tOutputFile(options.script);
    output.write(script);
    output.flush();
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
        throw CLI::ValidationError("--output", "'" + file + "' does not end in .svg or .png");
}

} // namespace

tVerb addPlot(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("plot", "Draw a trace");
    const auto options = std::make_shared<tOptions>();
    addTraceOptions(*verb, options->trace)->required();
    verb->add_option_function<std::string>(
            "-o,--output",
            [options](const std::string& file) {
                requirePictureName(file);
                options->plot.picture = file;
            },
            "The picture; its ending, .svg or .png,\nsays what kind")
        ->type_name("FILE")
        ->required();
    verb->add_option("--mask", options->plot.mask,
                     "Limits beside the stability curves, as of metrics")
        ->type_name("NAME")
        ->check(CLI::IsMember(curvedMaskNames()));
    verb->add_option("--script", options->script,
                     "Write the script for gnuplot instead; - is\nstdout")
        ->type_name("FILE");
    return {verb, [options] { plot(*options); }};
}
