#include "verbs/verbs.h"

#include "clocks/tSteeredClock.h"
#include "design/loopAdvice.h"
#include "servo/configDocument.h"
#include "servo/tuning.h"
#include "text/files.h"

#include <fmt/format.h>

#include <cstdio>
#include <memory>

namespace dravikHost {

namespace {

struct tCheck {
    std::string file;
    double intervalNs = 0; // 0: no advice
    std::optional<double> noiseNs;
    std::string library;
};

void run(const tCheck& options)
{
    const tServoLibrary library(tServoLibrary::find(options.library));
    tStillClock clock;
    tServoHost host(library, clock);
    tNotes notes;
    applyConfigFile(host, options.file, notes);
    writeText("-", host.readConfig() + "\n");
    for (const std::string& note : notes)
        fmt::print(stderr, "dravik-host: {}\n", note);
    if (options.intervalNs == 0) return;
    const auto inForce = tServoParameters::of(host.readConfig());
    fmt::print(stderr, "{}",
               loopAdvice(library, inForce, secondsOf(options.intervalNs), options.noiseNs));
}

} // namespace

std::function<void()> addCheck(tOptionSet& options)
{
    const auto check = std::make_shared<tCheck>();
    options.text("document", "FILE", check->file, "Configuration document").require();
    const tOption interval =
        options.quantity(check->intervalNs, {"--interval", kDuration, "", "1ms", "24h",
                                             "Time from pair to pair: advise on the loop"});
    options
        .quantity(check->noiseNs, {"--noise", kDuration, "", "1ns", "1s",
                                   "White, of measurements; deviation: advise\non threshold and "
                                   "filter too"})
        .needs(interval);
    options.library(check->library);
    return [check] { run(*check); };
}

} // namespace dravikHost
