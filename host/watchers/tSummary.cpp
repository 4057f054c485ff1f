#include "watchers/tSummary.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

namespace dravikHost {

namespace {

std::string times(int64_t count) { return fmt::format("{} time{}", count, count == 1 ? "" : "s"); }

} // namespace

void tSummary::tErrors::add(double errorNs)
{
    ++pairs;
    squares += errorNs * errorNs;
    peak = std::max(peak, std::fabs(errorNs));
}

std::string tSummary::tErrors::text() const
{
    return fmt::format("RMS {}, peak {}",
                       durationText(std::sqrt(squares / static_cast<double>(pairs))),
                       durationText(peak));
}

void tSummary::begin(const std::string& /*scenario*/, const tHostCalls& calls)
{
    addCalls(calls, false);
}

// What a dry run held back was not done, so it does not count as a call.
void tSummary::addCalls(const tHostCalls& calls, bool held)
{
    for (const tHostCall& call : calls) {
        if (!held || !isOrder(call.operation)) ++callCounts[call.operation];
        if (call.operation != kSetFrequency) continue;
        lowestPpb = lastPpb ? std::min(lowestPpb, call.ppb) : call.ppb;
        highestPpb = lastPpb ? std::max(highestPpb, call.ppb) : call.ppb;
        lastPpb = call.ppb;
    }
}

void tSummary::see(const tStep& step)
{
    if (firstLockNs && !locked) unlockedNs += step.pair.elapsedNs - lastElapsedNs;
    ++pairs;
    heldBack += step.heldBack ? 1 : 0;
    lastElapsedNs = step.pair.elapsedNs;
    locksLost = step.locksLost;
    locksMissed += step.event == kLockMissed ? 1 : 0;
    locked = step.locked;
    dryRun = step.dryRun;
    addCalls(step.calls, step.dryRun);
    if (!firstLockNs && locked) firstLockNs = lastElapsedNs;
    if (firstLockNs) addError(step);
}

void tSummary::addError(const tStep& step)
{
    againstTruth = step.pair.trueErrorNs.has_value();
    lastErrorNs = step.pair.trueErrorNs.value_or(static_cast<double>(step.pair.errorNs()));
    sinceLock.add(lastErrorNs);
    if (step.locked) whileLocked.add(lastErrorNs);
}

void tSummary::end(const std::string& /*remarks*/) { console.print(text()); }

std::string tSummary::text() const
{
    const std::string held = heldBack > 0 ? fmt::format("; {} held back", heldBack) : "";
    return fmt::format("pairs       {} in {} s{}\n", pairs, secondsText(lastElapsedNs, 3), held) +
           lockText() + errorText() + frequencyText() + callsText() + warningText();
}

std::string tSummary::lockText() const
{
    if (!firstLockNs) return fmt::format("lock        never; missed {}\n", times(locksMissed));
    return fmt::format("lock        after {} s, lost {}, missed {}; {} of {} pairs locked since\n",
                       secondsText(*firstLockNs, 3), times(locksLost), times(locksMissed),
                       whileLocked.pairs, sinceLock.pairs);
}

std::string tSummary::errorText() const
{
    if (!firstLockNs) return "";
    const std::string locked =
        whileLocked.pairs < sinceLock.pairs
            ? fmt::format("            while locked: {}\n", whileLocked.text())
            : "";
    return fmt::format("error       {}, last {}\n{}            (of the clock against {}, all pairs "
                       "since the first lock)\n",
                       sinceLock.text(), signedDurationText(lastErrorNs), locked,
                       againstTruth ? "the true time" : "the reference as measured");
}

std::string tSummary::frequencyText() const
{
    if (!lastPpb) return "frequency   never ordered\n";
    return fmt::format("frequency   {} {} to {}, last {}\n",
                       dryRun ? "would be ordered" : "ordered", offsetText(lowestPpb),
                       offsetText(highestPpb), offsetText(*lastPpb));
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

// A run that was without its lock is not judged by the time that it had one.
std::string tSummary::warningText() const
{
    constexpr const char* kAdvice =
        "            Compare the document with the noise: dravik-host check DOCUMENT --interval "
        "TIME\n"
        "            --noise TIME; or design one: dravik-host tune TRACE\n";
    if (dryRun || pairs == 0) return "";
    if (!firstLockNs) {
        return fmt::format("WARNING     the clock was never locked\n{}",
                           locksMissed > 0 ? kAdvice : "");
    }
    if (locksLost == 0) return "";
    const double share =
        static_cast<double>(unlockedNs) / static_cast<double>(lastElapsedNs - *firstLockNs);
    return fmt::format(
        "WARNING     the lock did not hold: lost {}, {:.3g} % of the time without it\n{}",
        times(locksLost), share * 100, kAdvice);
}

} // namespace dravikHost
