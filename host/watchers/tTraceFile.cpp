#include "watchers/tTraceFile.h"

#include "text/quantity.h"

#include <fmt/format.h>

namespace dravikHost {

tTraceFile::tTraceFile(const std::string& path)
{
    if (path.empty()) return;
    file.emplace(path);
    file->write("kind,elapsed_s,reference_ns,clock_ns,error_ns,true_error_ns,call,value\n");
}

void tTraceFile::begin(const std::string& /*scenario*/, const tHostCalls& calls)
{
    if (file) addCalls(0, calls, false);
}

// After a failure nothing follows, so what led to it is written out.
void tTraceFile::see(const tStep& step)
{
    if (!file) return;
    const tPair& pair = step.pair;
    const std::string trueError =
        pair.trueErrorNs ? fmt::format("{:.3f}", *pair.trueErrorNs) : std::string();
    file->write(fmt::format("pair,{},{},{},{},{},,\n", secondsText(pair.elapsedNs, 9),
                            pair.referenceNs, pair.clockNs, pair.errorNs(), trueError));
    addCalls(pair.elapsedNs, step.calls, step.dryRun);
    if (step.failure) file->flush();
}

void tTraceFile::see(const tSilence& silence)
{
    if (file) addCalls(silence.elapsedNs, silence.calls, false);
}

void tTraceFile::addCalls(int64_t elapsedNs, const tHostCalls& calls, bool held)
{
    for (const tHostCall& call : calls) {
        const char* const kind = held && isOrder(call.operation) ? "held" : "call";
        file->write(fmt::format("{},{},,,,,{},{}\n", kind, secondsText(elapsedNs, 9),
                                kHostOperationNames[call.operation],
                                isOfFrequency(call.operation) ? decimalText(call.ppb)
                                                              : std::to_string(call.ns)));
    }
}

void tTraceFile::end(const std::string& /*remarks*/)
{
    if (file) file->flush();
}

} // namespace dravikHost
