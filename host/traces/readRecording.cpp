#include "text/files.h"
#include "text/words.h"
#include "traces/iTraceFormat.h"
#include "traces/tCsvFormat.h"
#include "traces/tDaemonLogFormat.h"
#include "traces/tRefclocksLogFormat.h"

#include <fmt/format.h>

#include <array>
#include <stdexcept>

namespace dravikHost {

namespace {

class tFormats
{
public:
    // Null if no format recognises the line.
    iTraceFormat* of(std::string_view line)
    {
        for (iTraceFormat* const format : formats)
            if (format->recognises(line)) return format;
        return nullptr;
    }

private:
    tCsvFormat csv;
    tDaemonLogFormat daemonLog;
    tRefclocksLogFormat refclocksLog;
    const std::array<iTraceFormat*, 3> formats = {&csv, &daemonLog, &refclocksLog};
};

} // namespace

// The first line that some format recognises decides for all.
tRecording readRecording(const std::string& path, const std::string& sourceName)
{
    const std::string text = readText(path);
    const std::string name = path == "-" ? "the standard input" : path;
    tFormats formats;
    iTraceFormat* format = nullptr;
    tRecordingBuilder builder(sourceName);
    std::string_view rest = text;
    for (int64_t number = 1; !rest.empty(); ++number) {
        const std::string_view line = takeLine(rest);
        if (format == nullptr) format = formats.of(line);
        const std::string why =
            format != nullptr ? format->read(line, builder) : "in front of the first measurement";
        if (!why.empty()) builder.setUnread(number, why);
    }
    if (format == nullptr) {
        throw std::runtime_error(name + " is no trace: neither CSV with reference_ns and clock_ns, "
                                        "nor lines of ptp4l, phc2sys, ts2phc or refclocks.log");
    }
    format->finish(builder);
    return builder.finish(name, format->name());
}

} // namespace dravikHost
