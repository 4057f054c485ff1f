#include "traces/traceOptions.h"

#include <fmt/format.h>

#include <cstdio>

namespace {

void printUnread(const tRecording& recording)
{
    if (recording.unreadLines == 0) return;
    std::string examples;
    for (const tUnreadLine& line : recording.firstUnread)
        examples += fmt::format("{}{} ({})", examples.empty() ? "" : ", ", line.number, line.why);
    const bool all = recording.unreadLines == static_cast<int64_t>(recording.firstUnread.size());
    fmt::print(stderr, "dravik-host: {}: {} lines are not used, {} {}\n", recording.name,
               recording.unreadLines, all ? "lines" : "the first are lines", examples);
}

} // namespace

CLI::Option* addTraceOptions(CLI::App& app, tTraceOptions& options)
{
    app.add_option("--source", options.source,
                   "Which one, if the trace has several; a part of its name")
        ->type_name("NAME");
    return app
        .add_option(
            "trace", options.file,
            "CSV, lines of ptp4l, phc2sys or ts2phc,\nor chrony's refclocks.log; - is stdin")
        ->type_name("FILE");
}

void addFreeRunningOption(CLI::App& app, tTraceOptions& options)
{
    app.add_flag("--free-running", options.freeRunning,
                 "Where the trace tells no frequency and no\nsteps, the clock was given none");
}

tRecording readTrace(const tTraceOptions& options)
{
    tRecording recording = readRecording(options.file, options.source);
    printUnread(recording);
    if (!options.freeRunning) return recording;
    for (tRecordedPair& pair : recording.pairs)
        pair.orderedPpb = pair.orderedPpb.value_or(0);
    return recording;
}
