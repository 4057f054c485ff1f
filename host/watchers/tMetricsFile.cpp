#include "watchers/tMetricsFile.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <cmath>
#include <stdexcept>
#include <vector>

namespace dravikHost {

namespace {

struct tMetric {
    const char* name;
    const char* type; // counter or gauge
    const char* help;
    double value;
};

} // namespace

void tMetricsFile::see(const tStep& step)
{
    if (step.failure) return;
    latest = step;
    pairs += step.heldBack ? 0 : 1;
    write({step.pair.elapsedNs, {}, {}, step.leftOut});
}

void tMetricsFile::see(const tSilence& silence) { write(silence); }

// What happened last is to be seen, however soon after the file before.
void tMetricsFile::end(const std::string& /*remarks*/)
{
    if (wasWritten && !failing) put(last);
}

void tMetricsFile::write(const tSilence& now)
{
    if (path.empty()) return;
    last = now;
    if (writtenNs && now.elapsedNs - *writtenNs < kSecondNs) return;
    put(now);
}

void tMetricsFile::put(const tSilence& now)
{
    writtenNs = now.elapsedNs;
    try {
        replaceText(path, text(now));
        failing = false;
        wasWritten = true;
    } catch (const std::runtime_error& failure) {
        if (!wasWritten) throw;
        if (!failing) console.note(now.elapsedNs, failure.what());
        failing = true;
    }
}

std::string tMetricsFile::text(const tSilence& now) const
{
    const double unknown = std::nan("");
    const double errorNs = now.holdoverNs ? now.errorNs.value_or(unknown) : 0;
    std::vector<tMetric> metrics = {
        {"dravik_offset_seconds", "gauge", "Clock minus reference, as measured last.",
         pairs > 0 ? secondsOf(latest.pair.errorNs()) : unknown},
        {"dravik_frequency_offset", "gauge", "Offset of the clock's rate in force, a fraction.",
         latest.inForcePpb * 1e-9},
        {"dravik_locked", "gauge", "Whether the servo is locked.", latest.locked ? 1.0 : 0.0},
        {"dravik_holdover_seconds", "gauge", "Since the reference fell silent, 0 if it has not.",
         secondsOf(now.holdoverNs.value_or(0))},
        {"dravik_estimated_error_seconds", "gauge",
         "Deviation of the clock's error in holdover, 0 outside of it.", secondsOf(errorNs)},
        {"dravik_pairs_total", "counter", "Pairs handed to the servo.", static_cast<double>(pairs)},
        {"dravik_locks_lost_total", "counter", "Locks lost.",
         static_cast<double>(latest.locksLost)},
        {"dravik_steps_total", "counter", "Steps of the clock.", static_cast<double>(latest.steps)},
        {"dravik_samples_out_of_date_total", "counter",
         "Samples of the reference from before the latest order to the clock.",
         static_cast<double>(now.leftOut.outOfDate)},
        {"dravik_samples_unusable_total", "counter", "Samples of the reference not usable.",
         static_cast<double>(now.leftOut.unusable)},
    };
    if (latest.belief) {
        const tBelief& belief = *latest.belief;
        metrics.insert(
            metrics.end(),
            {{"dravik_noise_seconds", "gauge",
              "Deviation of a measurement, as self-tuning believes.", secondsOf(belief.noiseNs)},
             {"dravik_wander", "gauge",
              "Random walk of the oscillator's rate, a fraction per root second, as "
              "self-tuning believes.",
              belief.wanderPpb * 1e-9},
             {"dravik_gain", "gauge",
              "Share of what was not foreseen that is taken for the clock's.", belief.gain},
             {"dravik_expected_error_seconds", "gauge",
              "Deviation of the clock's error while locked, as self-tuning believes.",
              secondsOf(belief.errorNs)}});
    }
    std::string text;
    for (const tMetric& metric : metrics) {
        const std::string value =
            std::isnan(metric.value) ? "NaN" : fmt::format("{:.9g}", metric.value);
        text += fmt::format("# HELP {0} {1}\n# TYPE {0} {2}\n{0} {3}\n", metric.name, metric.help,
                            metric.type, value);
    }
    return text;
}

} // namespace dravikHost
