#include "verbs/verbs.h"

#include "metrics/figures.h"
#include "metrics/masks.h"
#include "metrics/stability.h"
#include "text/files.h"
#include "text/json.h"
#include "verbs/shared.h"

#include <fmt/format.h>

#include <cmath>
#include <memory>
#include <stdexcept>

namespace dravikHost {

namespace {

struct tMetrics {
    tTraceOptions trace;
    tSelection selection;
    std::string unit; // "": not told
    bool removeSlope = false;
    bool json = false;
    std::vector<tAssertion> assertions;
    std::vector<std::string> masks;
};

struct tRead {
    tRecording recording;
    tMeasured measured;
};

tRead read(const tMetrics& options)
{
    tTraceOptions trace = options.trace;
    if (!options.unit.empty()) trace.read.unitNs = parseQuantity("1" + options.unit, kDuration);
    tRead read{readWholeTrace(trace), {}};
    if (read.recording.pairs.empty() && !options.masks.empty())
        throw std::runtime_error("summaries cannot be held to a mask");
    read.measured = measure(read.recording, options.selection);
    if (options.removeSlope) read.measured.removeSlope();
    return read;
}

std::string durationOf(double seconds) { return durationText(nsOf(seconds)); }

std::string summaryText(const tMetrics& options, const tMeasured& measured)
{
    std::string text = fmt::format("{}: {}, {} points from {:.3f} s to {:.3f} s\n",
                                   options.trace.file, measured.what, measured.errors.size(),
                                   measured.fromSeconds, measured.toSeconds);
    const auto mean = measured.mean();
    const auto peakToPeak = measured.peakToPeak();
    text += fmt::format("mean {}, RMS {}, peak {}, peak to peak {}\n",
                        mean ? signedDurationText(nsOf(*mean)) : "not known",
                        durationOf(measured.rms()), durationOf(measured.peak()),
                        peakToPeak ? durationOf(*peakToPeak) : "not known");
    if (measured.locksLost) {
        text += measured.timeToLock
                    ? fmt::format("locked after {}, lock lost {} times\n",
                                  durationOf(*measured.timeToLock), *measured.locksLost)
                    : "never locked\n";
    }
    return text;
}

std::string tableText(const tMeasured& measured)
{
    const tSeries& series = measured.series;
    if (octaves(series).empty()) return "too few points for a deviation\n";
    std::string text =
        series.phase.size() == measured.errors.size()
            ? ""
            : fmt::format("longest stretch without a gap: {} points\n", series.phase.size());
    text += fmt::format("{:>10} {:>8} {:>10} {:>10} {:>10} {:>10} {:>10}\n", "tau", "n", "ADEV",
                        "OADEV", "MDEV", "TDEV", "MTIE");
    const auto number = [](const std::optional<double>& value) {
        return value ? fmt::format("{:.3e}", *value) : "-";
    };
    const auto time = [](const std::optional<double>& value) {
        return value ? durationOf(*value) : "-";
    };
    for (const size_t n : octaves(series)) {
        const tStability at = stabilityAt(series, n);
        text +=
            fmt::format("{:>10} {:>8} {:>10} {:>10} {:>10} {:>10} {:>10}\n",
                        durationOf(static_cast<double>(n) * series.interval), n, number(at.adev),
                        number(at.oadev), number(at.mdev), time(at.tdev), time(at.mtie));
    }
    return text;
}

std::string stabilityJson(const tSeries& series)
{
    std::string rows;
    for (const size_t n : octaves(series)) {
        const tStability at = stabilityAt(series, n);
        rows += rows.empty() ? "\n  " : ",\n  ";
        rows += tJsonObject()
                    .add("n", std::to_string(n))
                    .add("tau", static_cast<double>(n) * series.interval)
                    .add("adev", at.adev)
                    .add("oadev", at.oadev)
                    .add("mdev", at.mdev)
                    .add("tdev", at.tdev)
                    .add("mtie", at.mtie)
                    .line();
    }
    return "[" + rows + "]";
}

// SI units; what is not known is null.
std::string jsonText(const tRecording& recording, const tMeasured& measured)
{
    const auto interval =
        measured.series.interval > 0 ? std::optional(measured.series.interval) : std::nullopt;
    const auto locksLost =
        measured.locksLost ? std::optional(static_cast<double>(*measured.locksLost)) : std::nullopt;
    return tJsonObject()
               .add("points", std::to_string(measured.errors.size()))
               .add("from", measured.fromSeconds)
               .add("to", measured.toSeconds)
               .add("mean", measured.mean())
               .add("rms", measured.rms())
               .add("peak", measured.peak() + 0.0) // no -0
               .add("peakToPeak", measured.peakToPeak())
               .add("timeToLock", measured.timeToLock)
               .add("locksLost", locksLost)
               .add("interval", interval)
               .add("stretch", std::to_string(measured.series.phase.size()))
               .add("stability", stabilityJson(measured.series))
               .add("format", jsonQuoted(recording.format))
               .add("source", jsonQuoted(recording.source))
               .add("unread", std::to_string(recording.unreadLines))
               .add("events", std::to_string(recording.events))
               .line() +
           "\n";
}

// One line for each limit; returns what is wrong, "" if all are held.
std::string reportMasks(const tMetrics& options, const tMeasured& measured, tOutputFile& output)
{
    int counts[3] = {};
    for (const std::string& name : options.masks) {
        output.write(fmt::format("mask {}: {}\n", name, maskTitle(name)));
        for (const tMaskLine& line : checkMask(name, measured)) {
            constexpr const char* kVerdicts[] = {"held", "broken", "not judged"};
            output.write(fmt::format("mask {:<10} {:<53} {:<11} {}\n", name, line.limit,
                                     kVerdicts[line.verdict], line.found));
            ++counts[line.verdict];
        }
    }
    const int broken = counts[tMaskLine::kBroken];
    const int notJudged = counts[tMaskLine::kNotJudged];
    std::string failures;
    if (broken > 0) failures = fmt::format("broken: {}", broken);
    if (notJudged > 0)
        failures += fmt::format("{}not judged: {}", broken > 0 ? ", " : "", notJudged);
    return failures.empty() ? "" : "limits of masks " + failures;
}

void run(const tMetrics& options)
{
    const tRead found = read(options);
    const tMeasured& measured = found.measured;
    tOutputFile output("-");
    tOutputFile other = tOutputFile::standardError();
    if (options.json) {
        output.write(jsonText(found.recording, measured));
    } else {
        output.write(summaryText(options, measured) + tableText(measured));
    }
    std::string failures = reportMasks(options, measured, options.json ? other : output);
    output.flush();
    for (const tAssertion& assertion : options.assertions) {
        const std::string failure = assertion.failure(measured);
        if (failure.empty()) continue;
        failures += (failures.empty() ? "" : "; ") + failure;
    }
    if (!failures.empty()) throw tLimitBroken(failures);
}

void addSelection(tOptionSet& options, tMetrics& metrics)
{
    options.quantity(metrics.selection.fromNs,
                     {"--from", kDuration, "", "0ns", "438300h",
                      "Elapsed time to begin at; else the first lock,\nif the trace tells of "
                      "locks"});
    options.quantity(metrics.selection.toNs,
                     {"--to", kDuration, "", "0ns", "438300h", "Elapsed time to end at"});
    options.flag("--measured", metrics.selection.measured,
                 "The measured error, even if the true one is\nknown");
    const tOption interval = options.quantity(
        metrics.trace.read.intervalNs,
        {"--interval", kDuration, "", "1ns", "438300h",
         "The file is plain numbers, phase in seconds, or\nlines without a time, so far apart"});
    options
        .flag("--frequency", metrics.trace.read.frequency, "The numbers are fractional frequency")
        .needs(interval);
    options
        .text("--unit", "UNIT", metrics.unit,
              "Of errors in columns whose header tells none:\nns, us, ms or s; else s")
        .oneOf({"ns", "us", "ms", "s"});
    options.flag("--remove-slope", metrics.removeSlope,
                 "Without the line from the first point to the last");
}

} // namespace

std::function<void()> addMetrics(tOptionSet& options)
{
    const auto metrics = std::make_shared<tMetrics>();
    addTraceOptions(options, metrics->trace).require();
    addSelection(options, *metrics);
    options.flag("--json", metrics->json, "One JSON object in SI units instead of a table");
    options.repeatable(
        "--assert", "FIGURE<LIMIT",
        [metrics](const std::string& text) { metrics->assertions.emplace_back(text); },
        "Such as 'rms<20ns' or 'tdev(10s)<=1ns'; repeatable");
    options
        .repeatable(
            "--mask", "NAME",
            [metrics](const std::string& name) { metrics->masks.push_back(name); },
            "g8273.2-a, -b, -c, -d, g8273.3-a, -b or\n802.1as; repeatable")
        .oneOf(maskNames());
    return [metrics] { run(*metrics); };
}

} // namespace dravikHost
