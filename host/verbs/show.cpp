#include "verbs/verbs.h"

#include "clocks/tSteeredClock.h"
#include "servo/tuning.h"
#include "text/files.h"
#include "verbs/shared.h"

#include <fmt/format.h>

#include <cstdio>
#include <memory>

namespace dravikHost {

namespace {

struct tShow {
    std::string library;
    tTuning tuning;
};

void run(const tShow& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tStillClock clock;
    tServoHost host(library, clock);
    for (const std::string& note : tune(host, options.tuning))
        fmt::print(stderr, "dravik-host: {}\n", note);
    writeText("-", host.readConfig() + "\n");
}

} // namespace

std::function<void()> addShow(tOptionSet& options)
{
    const auto show = std::make_shared<tShow>();
    addTuningOptions(options, show->tuning);
    options.library(show->library);
    options.finally([show] { requireOneInput(show->tuning); });
    return [show] { run(*show); };
}

} // namespace dravikHost
