#include "verbs/check.h"

#include "clocks/tSteeredClock.h"
#include "servo/configDocument.h"
#include "servo/printConfig.h"
#include "servo/tuning.h"

#include <cstdio>
#include <memory>

namespace {

struct tOptions {
    std::string file;
    std::string library;
};

void check(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tSteeredClock clock(0, 0, 0); // stands still: there are no pairs
    tServoHost host(library, clock);
    const std::string document = applyConfigFile(host, options.file);
    printConfig(host);
    const std::string ignored = ignoredText(document);
    if (!ignored.empty())
        (void)std::fprintf(stderr, "dravik-host: %s: %s\n", options.file.c_str(), ignored.c_str());
}

} // namespace

tVerb addCheck(CLI::App& app)
{
    CLI::App* const verb =
        app.add_subcommand("check", "Tell whether a document is taken, or why not");
    const auto options = std::make_shared<tOptions>();
    verb->add_option("document", options->file, "Configuration document")
        ->type_name("FILE")
        ->required();
    addLibraryOption(*verb, options->library);
    return {verb, [options] { check(*options); }};
}
