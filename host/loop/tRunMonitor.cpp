#include "loop/tRunMonitor.h"

#include "text/quantity.h"

#include <fmt/format.h>

void tRunMonitor::pair(const tPair& pair, const tState& state, tReport& report)
{
    latestErrorNs = static_cast<double>(pair.errorNs());
    if (options.statusIntervalNs) printStatus(pair, state, report);
    writeMetrics(pair.elapsedNs, state);
}

void tRunMonitor::silence(int64_t elapsedNs, const tState& state)
{
    writeMetrics(elapsedNs, state);
}

void tRunMonitor::printStatus(const tPair& pair, const tState& state, tReport& report)
{
    const std::string head = fmt::format("dravik-host[{}]:", secondsText(pair.elapsedNs, 3));
    if (*options.statusIntervalNs == 0) {
        report.print(fmt::format("{} offset {:>10} s{} freq {:>+7.0f}\n", head, pair.errorNs(),
                                 state.locked ? 2 : 0, 0 - state.orderedPpb));
        return;
    }
    figures.add(pair, state.orderedPpb);
    if (!lineNs) lineNs = pair.elapsedNs;
    if (pair.elapsedNs - *lineNs < *options.statusIntervalNs) return;
    report.print(fmt::format("{} rms {:>4.0f} max {:>4.0f} freq {:>+7.0f} +/- {:>3.0f}\n", head,
                             figures.rmsNs(), figures.peakNs(), 0 - figures.meanPpb(),
                             figures.deviationPpb()));
    lineNs = pair.elapsedNs;
    figures = {};
}

// At most once a second.
void tRunMonitor::writeMetrics(int64_t elapsedNs, const tState& state)
{
    constexpr int64_t kPauseNs = 1'000'000'000;
    if (metricsNs && elapsedNs - *metricsNs < kPauseNs) return;
    metricsNs = elapsedNs;
    const auto number = [](auto value) { return static_cast<double>(value); };
    metrics.write({
        {"dravik_offset_seconds", "gauge", "Clock minus reference, as measured last.",
         latestErrorNs * 1e-9},
        {"dravik_frequency_offset", "gauge", "Ordered offset of the clock's rate, a fraction.",
         state.orderedPpb * 1e-9},
        {"dravik_locked", "gauge", "Whether the servo is locked.", state.locked ? 1.0 : 0.0},
        {"dravik_holdover_seconds", "gauge", "Since the reference fell silent, 0 if it has not.",
         number(state.holdoverNs) * 1e-9},
        {"dravik_estimated_error_seconds", "gauge",
         "One deviation of the clock's error in holdover.",
         state.holdoverErrorNs.value_or(0) * 1e-9},
        {"dravik_pairs_total", "counter", "Pairs handed to the servo.", number(state.pairs)},
        {"dravik_locks_lost_total", "counter", "Locks lost.", number(state.locksLost)},
        {"dravik_steps_total", "counter", "Steps of the clock.", number(state.steps)},
    });
}
