#include "verbs/check.h"

#include "clocks/tSteeredClock.h"
#include "design/loopAdvice.h"
#include "servo/configDocument.h"
#include "servo/printConfig.h"
#include "servo/tuning.h"

#include <fmt/format.h>

#include <cstdio>
#include <memory>

namespace {

struct tOptions {
    std::string file;
    double intervalNs = 0; // 0: no advice
    std::optional<double> noiseNs;
    std::string library;
};

void check(const tOptions& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tSteeredClock clock(0, 0, 0); // stands still: there are no pairs
    tServoHost host(library, clock);
    const std::string document = applyConfigFile(host, options.file);
    printConfig(host);
    for (const std::string& note : documentNotes(document))
        fmt::print(stderr, "dravik-host: {}: {}\n", options.file, note);
    if (options.intervalNs == 0) return;
    const auto inForce = tServoParameters::of(host.readConfig());
    fmt::print(stderr, "{}", loopAdvice(inForce, options.intervalNs * 1e-9, options.noiseNs));
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
    addQuantity(
        *verb, options->intervalNs,
        {"--interval", kDuration, "", "1ms", "24h", "Time from pair to pair: advise on the loop"});
    addQuantity(*verb, options->noiseNs,
                {"--noise", kDuration, "", "1ns", "1s",
                 "White, of measurements; deviation: advise\non threshold and filter too"});
    addLibraryOption(*verb, options->library);
    verb->get_option("--noise")->needs("--interval");
    return {verb, [options] { check(*options); }};
}
