#include "verbs/metrics.h"

#include "metrics/masks.h"
#include "metrics/stability.h"
#include "metrics/tAssertion.h"
#include "text/tLimitBroken.h"
#include "text/tOutputFile.h"
#include "traces/traceOptions.h"

#include <fmt/format.h>

#include <memory>

namespace {

struct tOptions {
    tTraceOptions trace;
    tSelection selection;
    std::optional<double> numbersIntervalNs; // then the file is plain numbers
    bool frequency = false;
    bool removeSlope = false;
    bool json = false;
    std::vector<tAssertion> assertions;
    std::vector<std::string> masks;
};

tMeasured read(const tOptions& options)
{
    tMeasured measured =
        options.numbersIntervalNs
            ? readNumbers(options.trace.file, *options.numbersIntervalNs * 1e-9, options.frequency)
            : measure(readTrace(options.trace), options.selection);
    if (options.removeSlope) measured.removeSlope();
    return measured;
}

std::string durationOf(double seconds) { return durationText(seconds * 1e9); }

std::string summaryText(const tOptions& options, const tMeasured& measured)
{
    std::string text = fmt::format("{}: {}, {} points from {:.3f} s to {:.3f} s\n",
                                   options.trace.file, measured.what, measured.errors.size(),
                                   measured.fromSeconds, measured.toSeconds);
    text += fmt::format("mean {}, RMS {}, peak {}, peak to peak {}\n",
                        signedDurationText(measured.mean() * 1e9), durationOf(measured.rms()),
                        durationOf(measured.peak()), durationOf(measured.peakToPeak()));
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

// SI units; what is not known is null.
std::string jsonText(const tMeasured& measured)
{
    const auto number = [](const std::optional<double>& value) {
        return value ? fmt::format("{}", *value) : "null";
    };
    const auto locksLost =
        measured.locksLost ? std::optional(static_cast<double>(*measured.locksLost)) : std::nullopt;
    std::string text = fmt::format(
        "{{\"points\": {}, \"from\": {}, \"to\": {}, \"mean\": {}, \"rms\": {}, \"peak\": {}, "
        "\"peakToPeak\": {}, \"timeToLock\": {}, \"locksLost\": {}, \"interval\": {}, "
        "\"stretch\": {}, \"stability\": [",
        measured.errors.size(), measured.fromSeconds, measured.toSeconds, measured.mean(),
        measured.rms(), measured.peak(), measured.peakToPeak(), number(measured.timeToLock),
        number(locksLost), measured.series.interval, measured.series.phase.size());
    const char* separator = "\n";
    for (const size_t n : octaves(measured.series)) {
        const tStability at = stabilityAt(measured.series, n);
        text += fmt::format(
            "{}  {{\"n\": {}, \"tau\": {}, \"adev\": {}, \"oadev\": {}, \"mdev\": {}, "
            "\"tdev\": {}, \"mtie\": {}}}",
            separator, n, static_cast<double>(n) * measured.series.interval, number(at.adev),
            number(at.oadev), number(at.mdev), number(at.tdev), number(at.mtie));
        separator = ",\n";
    }
    return text + "]}\n";
}

// One line for each limit; returns what is wrong, "" if all are held.
std::string reportMasks(const tOptions& options, const tMeasured& measured, tOutputFile& output)
{
    int counts[3] = {};
    for (const std::string& name : options.masks) {
        for (const tMaskLine& line : checkMask(name, measured)) {
            constexpr const char* kVerdicts[] = {"held", "broken", "not checked"};
            output.write(fmt::format("mask {:<10} {:<34} {:<12} {}\n", name, line.limit,
                                     kVerdicts[line.verdict], line.found));
            ++counts[line.verdict];
        }
    }
    if (counts[tMaskLine::kBroken] > 0)
        return fmt::format("limits of masks broken: {}", counts[tMaskLine::kBroken]);
    if (counts[tMaskLine::kNotChecked] > 0)
        return fmt::format("limits of masks not checked: {}", counts[tMaskLine::kNotChecked]);
    return "";
}

void metrics(const tOptions& options)
{
    const tMeasured measured = read(options);
    tOutputFile output(stdout, "the standard output");
    tOutputFile other(stderr, "the standard error output");
    if (options.json) {
        output.write(jsonText(measured));
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

void addSelection(CLI::App& app, tOptions& options)
{
    addQuantity(app, options.selection.fromNs,
                {"--from", kDuration, "", "0ns", "438300h",
                 "Elapsed time to begin at; else the first lock,\nif the trace tells of locks"});
    addQuantity(app, options.selection.toNs,
                {"--to", kDuration, "", "0ns", "438300h", "Elapsed time to end at"});
    app.add_flag("--measured", options.selection.measured,
                 "The measured error, even if the true one is\nknown");
    addQuantity(app, options.numbersIntervalNs,
                {"--interval", kDuration, "", "1ns", "438300h",
                 "The file is plain numbers, so far apart:\nphase in seconds"});
    app.add_flag("--frequency", options.frequency, "They are fractional frequency")
        ->needs("--interval");
    app.add_flag("--remove-slope", options.removeSlope,
                 "Without the line from the first point to the last");
}

} // namespace

tVerb addMetrics(CLI::App& app)
{
    CLI::App* const verb = app.add_subcommand("metrics", "Tell what a trace is worth");
    const auto options = std::make_shared<tOptions>();
    addTraceOptions(*verb, options->trace)->required();
    addSelection(*verb, *options);
    verb->add_flag("--json", options->json, "One JSON object in SI units instead of a table");
    const auto addAssertion = [options](const std::vector<std::string>& texts) {
        for (const std::string& text : texts) {
            try {
                options->assertions.emplace_back(text);
            } catch (const std::invalid_argument& failure) {
                throw CLI::ValidationError("--assert", failure.what());
            }
        }
    };
    verb->add_option_function<std::vector<std::string>>(
            "--assert", addAssertion, "Such as 'rms<20ns' or 'tdev(10s)<=1ns'; repeatable")
        ->type_name("FIGURE<LIMIT")
        ->expected(1)
        ->take_all();
    verb->add_option("--mask", options->masks, "g8273.2-a, -b, -c, -d or 802.1as; repeatable")
        ->type_name("NAME")
        ->expected(1)
        ->take_all()
        ->check(CLI::IsMember(maskNames()));
    return {verb, [options] { metrics(*options); }};
}
