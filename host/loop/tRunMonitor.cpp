#include "loop/tRunMonitor.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <stdexcept>

void tRunMonitor::pair(const tPair& pair, const tState& state, tReport& report)
{
    latestErrorNs = static_cast<double>(pair.errorNs());
    if (options.statusIntervalNs) printStatus(pair, state, report);
    writeMetrics(pair.elapsedNs, state, report);
}

void tRunMonitor::silence(int64_t elapsedNs, const tState& state, tReport& report)
{
    if (options.statusIntervalNs && state.holdoverNs > 0) printSilence(elapsedNs, state, report);
    writeMetrics(elapsedNs, state, report);
}

void tRunMonitor::printStatus(const tPair& pair, const tState& state, tReport& report)
{
    const std::string head = fmt::format("dravik-host[{}]:", secondsText(pair.elapsedNs, 3));
    if (*options.statusIntervalNs == 0) {
        report.print(fmt::format("{} offset {:>10} s{} freq {:>+7.0f}\n", head, pair.errorNs(),
                                 state.locked    ? 2
                                 : state.stepped ? 1
                                                 : 0,
                                 0 - state.inForcePpb));
        return;
    }
    figures.add(pair, state.inForcePpb);
    if (!lineNs) lineNs = pair.elapsedNs;
    if (pair.elapsedNs - *lineNs < *options.statusIntervalNs) return;
    report.print(fmt::format("{} rms {:>4.0f} max {:>4.0f} freq {:>+7.0f} +/- {:>3.0f}\n", head,
                             figures.rmsNs(), figures.peakNs(), 0 - figures.meanPpb(),
                             figures.deviationPpb()));
    lineNs = pair.elapsedNs;
    figures = {};
}

// At most once a second.
void tRunMonitor::printSilence(int64_t elapsedNs, const tState& state, tReport& report)
{
    constexpr int64_t kLeastNs = 1'000'000'000;
    if (lineNs && elapsedNs - *lineNs < std::max(*options.statusIntervalNs, kLeastNs)) return;
    lineNs = elapsedNs;
    report.print(fmt::format(
        "dravik-host[{}]: holdover for {}, error {}\n", secondsText(elapsedNs, 3),
        durationText(static_cast<double>(state.holdoverNs)),
        state.holdoverErrorNs ? "about " + durationText(*state.holdoverErrorNs) : "unknown"));
}

// At most once a second. A file that could be written at first may fail later without an end to the
// discipline.
void tRunMonitor::writeMetrics(int64_t elapsedNs, const tState& state, tReport& report)
{
    constexpr int64_t kPauseNs = 1'000'000'000;
    if (metricsNs && elapsedNs - *metricsNs < kPauseNs) return;
    const bool isFirst = !metricsNs;
    metricsNs = elapsedNs;
    try {
        metrics.write(figuresOf(state));
        metricsFail = false;
    } catch (const std::runtime_error& failure) {
        if (isFirst) throw;
        if (!metricsFail) report.note(elapsedNs, failure.what());
        metricsFail = true;
    }
}

std::vector<tMetric> tRunMonitor::figuresOf(const tState& state) const
{
    const auto number = [](auto value) { return static_cast<double>(value); };
    const double unknown = std::nan("");
    const double errorNs = state.holdoverNs > 0 ? state.holdoverErrorNs.value_or(unknown) : 0;
    return {
        {"dravik_offset_seconds", "gauge", "Clock minus reference, as measured last.",
         latestErrorNs * 1e-9},
        {"dravik_frequency_offset", "gauge", "Ordered offset of the clock's rate, a fraction.",
         state.inForcePpb * 1e-9},
        {"dravik_locked", "gauge", "Whether the servo is locked.", state.locked ? 1.0 : 0.0},
        {"dravik_holdover_seconds", "gauge", "Since the reference fell silent, 0 if it has not.",
         number(state.holdoverNs) * 1e-9},
        {"dravik_estimated_error_seconds", "gauge",
         "One deviation of the clock's error in holdover, 0 if it is none.", errorNs * 1e-9},
        {"dravik_pairs_total", "counter", "Pairs handed to the servo.", number(state.pairs)},
        {"dravik_locks_lost_total", "counter", "Locks lost.", number(state.locksLost)},
        {"dravik_steps_total", "counter", "Steps of the clock.", number(state.steps)},
    };
}
