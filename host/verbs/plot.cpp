#include "verbs/plot.h"

#include "plot/plotScript.h"
#include "plot/runGnuplot.h"
#include "text/tOutputFile.h"
#include "traces/traceOptions.h"

#include <memory>

namespace {

struct tOptions {
    tTraceOptions trace;
    std::string picture;
    std::string script; // "": none; "-": stdout
};

void plot(const tOptions& options)
{
    const std::string script = plotScript(readTrace(options.trace), options.picture);
    if (options.script.empty()) {
        runGnuplot(script);
        return;
    }
    tOutputFile output = options.script == "-" ? tOutputFile(stdout, "the standard output")
                                               : tOutputFile(options.script);
    output.write(script);
    output.flush();
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
                options->picture = file;
            },
            "The picture; its ending, .svg or .png,\nsays what kind")
        ->type_name("FILE")
        ->required();
    verb->add_option("--script", options->script,
                     "Write the script for gnuplot instead; - is\nstdout")
        ->type_name("FILE");
    return {verb, [options] { plot(*options); }};
}
