// dravik-host: loads the clock servo plug-in as any other host would, and lets it discipline a
// clock. Each word of the command line is a file in verbs/. simulate, replay and run choose a clock
// and a source of pairs, and share the loop; the others work on documents, traces and the machine.

#include "text/tLimitBroken.h"
#include "verbs/check.h"
#include "verbs/doctor.h"
#include "verbs/metrics.h"
#include "verbs/plot.h"
#include "verbs/replay.h"
#include "verbs/run.h"
#include "verbs/show.h"
#include "verbs/simulate.h"
#include "verbs/tune.h"

#include <cstdio>
#include <exception>

namespace {

enum tExitStatus { kGood = 0, kFailure = 1, kUsage = 2, kLimitBroken = 3 };

constexpr const char* kFooter =
    "Values have units: ns us ms s min h, ppb ppm, %.\n"
    "Files may be -, the standard input or output.\n"
    "Exit status: 0 good; 1 a failure of the plug-in or of a file, such as a\n"
    "refused document; 2 wrong usage; 3 a limit of metrics is not held.";

std::string errorLine(const CLI::App* /*app*/, const CLI::Error& error)
{
    return std::string("dravik-host: ") + error.what() + "\n";
}

int hostMain(int argc, char** argv)
{
    CLI::App app("Reference host of the clock servo plug-in", "dravik-host");
    app.get_formatter()->column_width(40);
    app.set_version_flag("--version", "dravik-host " DRAVIK_VERSION, "Print the version and exit");
    app.require_subcommand(0, 1);
    app.failure_message(errorLine);
    app.footer(kFooter);
    const tVerb verbs[] = {addSimulate(app), addReplay(app), addRun(app),
                           addTune(app),     addCheck(app),  addShow(app),
                           addMetrics(app),  addPlot(app),   addDoctor(app)};
    try {
        app.parse(argc, argv);
        if (app.get_subcommands().empty())
            throw CLI::RequiredError("A verb, such as simulate or run,");
    } catch (const CLI::ParseError& outcome) { // help and version come this way too
        return app.exit(outcome) == 0 ? kGood : kUsage;
    }
    for (const tVerb& verb : verbs)
        if (verb.app->parsed()) verb.run();
    return kGood;
}

} // namespace

int main(int argc, char** argv)
{
    try {
        return hostMain(argc, argv);
    } catch (const tLimitBroken& broken) {
        (void)std::fprintf(stderr, "dravik-host: %s\n", broken.what());
        return kLimitBroken;
    } catch (const std::exception& failure) {
        (void)std::fprintf(stderr, "dravik-host: %s\n", failure.what());
        return kFailure;
    }
}
