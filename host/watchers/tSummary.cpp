#include "watchers/tSummary.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

namespace dravikHost {

void tSummary::addCalls(const tHostCalls& calls)
{
    for (const tHostCall& call : calls) {
        if (call.operation == kSetFrequency) {
            const bool first = callCounts[kSetFrequency] == 0;
            lowestPpb = first ? call.value : std::min(lowestPpb, call.value);
            highestPpb = first ? call.value : std::max(highestPpb, call.value);
            lastPpb = call.value;
        }
        ++callCounts[call.operation];
    }
}

void tSummary::begin(const std::string& /*scenario*/, const tHostCalls& calls) { addCalls(calls); }

void tSummary::see(const tStep& step)
{
    const tPair& pair = step.pair;
    ++pairs;
    lastElapsedNs = pair.elapsedNs;
    heldBack += step.heldBack ? 1 : 0;
    locksLost = step.locksLost;
    addCalls(step.calls);
    if (step.heldBack || !step.locked) return;
    if (lockedPairs++ == 0) firstLockNs = pair.elapsedNs;
    againstTruth = pair.trueErrorNs.has_value();
    lastErrorNs = pair.trueErrorNs.value_or(static_cast<double>(pair.errorNs()));
    squaresNs2 += lastErrorNs * lastErrorNs;
    peakNs = std::max(peakNs, std::fabs(lastErrorNs));
}

void tSummary::end(const std::string& /*remarks*/) { console.print(text()); }

std::string tSummary::text() const
{
    const std::string held = heldBack > 0 ? fmt::format("; {} held back", heldBack) : "";
    return fmt::format("pairs       {} in {} s{}\n", pairs, secondsText(lastElapsedNs, 3), held) +
           lockText() + errorText() + frequencyText() + callsText();
}

std::string tSummary::lockText() const
{
    if (lockedPairs == 0) return "lock        never\n";
    return fmt::format("lock        after {} s, lost {} time{}; {} pairs locked\n",
                       secondsText(firstLockNs, 3), locksLost, locksLost == 1 ? "" : "s",
                       lockedPairs);
}

std::string tSummary::errorText() const
{
    if (lockedPairs == 0) return "";
    return fmt::format("error       RMS {}, peak {}, last {}\n"
                       "            (of the clock against {}, while locked)\n",
                       durationText(std::sqrt(squaresNs2 / static_cast<double>(lockedPairs))),
                       durationText(peakNs), signedDurationText(lastErrorNs),
                       againstTruth ? "the true time" : "the reference as measured");
}

std::string tSummary::frequencyText() const
{
    if (callCounts[kSetFrequency] == 0) return "frequency   never ordered\n";
    const auto text = [](int64_t ppb) { return offsetText(static_cast<double>(ppb)); };
    return fmt::format("frequency   ordered {} to {}, last {}\n", text(lowestPpb), text(highestPpb),
                       text(lastPpb));
}

std::string tSummary::callsText() const
{
    std::string list = "host calls  ";
    for (size_t i = 0; i < callCounts.size(); ++i) {
        const bool breakLine = i == kGetMaxFrequencyOffset;
        list += i == 0 ? "" : breakLine ? ",\n            " : ", ";
        list += fmt::format("{} {}", kHostOperationNames[i], callCounts[i]);
    }
    return list + "\n";
}

} // namespace dravikHost
