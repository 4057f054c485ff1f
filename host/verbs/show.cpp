#include "verbs/show.h"

#include "clocks/tSteeredClock.h"
#include "servo/printConfig.h"
#include "servo/tuning.h"

#include <memory>

namespace {

struct tOptions {
    std::string library;
    tTuning tuning;
};

void show(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tSteeredClock clock(0, 0, 0); // stands still: there are no pairs
    tServoHost host(library, clock);
    tune(host, options.tuning);
    printConfig(host);
}

} // namespace

tVerb addShow(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("show", "Print the configuration document in force");
    const auto options = std::make_shared<tOptions>();
    addTuningOptions(*verb, options->tuning);
    addLibraryOption(*verb, options->library);
    return {verb, [options] { show(*options); }};
}
