#include "loop/tTrace.h"

#include "text/quantity.h"

#include <fmt/format.h>

tTrace::tTrace(const std::string& path, bool isDryRun) : dryRun(isDryRun)
{
    if (path.empty()) return;
    if (path == "-") {
        file.emplace(stdout, "the standard output");
    } else {
        file.emplace(path);
    }
    file->write("kind,elapsed_s,reference_ns,clock_ns,error_ns,true_error_ns,call,value\n");
}

void tTrace::addPair(const tPair& pair)
{
    if (!file) return;
    const std::string trueError =
        pair.trueErrorNs ? fmt::format("{:.3f}", *pair.trueErrorNs) : std::string();
    file->write(fmt::format("pair,{},{},{},{},{},,\n", secondsText(pair.elapsedNs, 9),
                            pair.referenceNs, pair.clockNs, pair.errorNs(), trueError));
}

void tTrace::addCalls(int64_t elapsedNs, const tHostCalls& calls)
{
    if (!file) return;
    for (const tHostCall& call : calls) {
        const bool held = dryRun && isOrder(call.operation);
        file->write(fmt::format("{},{},,,,,{},{}\n", held ? "held" : "call",
                                secondsText(elapsedNs, 9), kHostOperationNames[call.operation],
                                call.value));
    }
}

void tTrace::flush()
{
    if (file) file->flush();
}
