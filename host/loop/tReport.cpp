#include "loop/tReport.h"

#include "text/quantity.h"

#include <fmt/format.h>

namespace {

double valueOf(const tHostCalls& calls, tHostOperation operation)
{
    const tHostCall* const call = findCall(calls, operation);
    return call != nullptr ? static_cast<double>(call->value) : 0;
}

std::string eventText(tLockEvent event, const tHostCalls& calls, const std::string& error)
{
    const double orderedPpb = valueOf(calls, kSetFrequency);
    switch (event) {
    case kFrequencyMeasured: // the correction, the other way round, is how far it had been off
        return fmt::format("frequency measured: {} off, now steered by {}",
                           offsetText(valueOf(calls, kGetFrequency) - orderedPpb),
                           offsetText(orderedPpb));
    case kFrequencyAtLimit:
        return fmt::format("frequency at its limit, {}", offsetText(orderedPpb));
    case kStepped:
        return fmt::format("stepped by {}", signedDurationText(valueOf(calls, kStepTime)));
    case kNotStepped:
        return fmt::format("no step needed, error {}", error);
    case kLockGained:
        return fmt::format("locked, error {}", error);
    case kLockMissed:
        return fmt::format("lock missed, error {}", error);
    case kLockLost:
        return fmt::format("lock lost, error {}", error);
    case kNothingNew:
        break;
    }
    return "";
}

} // namespace

tReport::tReport(bool stdoutTaken)
    : output(stdoutTaken ? stderr : stdout,
             stdoutTaken ? "the standard error output" : "the standard output")
{}

void tReport::print(const std::string& text)
{
    line.clear();
    output.write(text);
    output.flush(); // it may be read through a pipe while the run goes on
}

void tReport::event(const tPair& pair, tLockEvent event, const tHostCalls& calls)
{
    if (event == kNothingNew) return;
    const std::string error = signedDurationText(static_cast<double>(pair.errorNs()));
    note(pair.elapsedNs, eventText(event, calls, error));
}

void tReport::note(int64_t elapsedNs, const std::string& text)
{
    if (!text.empty()) print(fmt::format("{:>10} s  {}\n", secondsText(elapsedNs, 3), text));
}

void tReport::progressText(const std::string& text)
{
    if (line.due()) line.show(text);
}

void tReport::progress(const tPair& pair, bool locked)
{
    if (!line.due()) return;
    line.show(fmt::format("{:>10} s  {}, error {}", secondsText(pair.elapsedNs, 3),
                          locked ? "locked" : "not locked",
                          signedDurationText(static_cast<double>(pair.errorNs()))));
}
