#include "text/files.h"
#include "text/words.h"
#include "traces/iTraceFormat.h"

#include <fmt/format.h>

#include <memory>
#include <stdexcept>
#include <vector>

namespace dravikHost {

namespace {

using tFormats = std::vector<std::unique_ptr<iTraceFormat>>;

tFormats allFormats()
{
    tFormats formats;
    for (const auto make : {csvFormat, daemonLogFormat, refclocksLogFormat})
        formats.push_back(make());
    return formats;
}

// Null if no format recognises the line.
iTraceFormat* formatOf(std::string_view line, const tFormats& formats)
{
    for (const auto& format : formats)
        if (format->recognises(line)) return format.get();
    return nullptr;
}

} // namespace

// The first line that some format recognises decides for all.
tRecording readRecording(const std::string& path, const std::string& sourceName)
{
    const std::string text = readText(path);
    const std::string name = path == "-" ? "the standard input" : path;
    const tFormats formats = allFormats();
    iTraceFormat* format = nullptr;
    tRecordingBuilder builder(sourceName);
    std::string_view rest = text;
    for (int64_t number = 1; !rest.empty(); ++number) {
        const std::string_view line = takeLine(rest);
        if (format == nullptr) format = formatOf(line, formats);
        const std::string why =
            format != nullptr ? format->read(line, builder) : "in front of the first measurement";
        if (!why.empty()) builder.setUnread(number, why);
    }
    if (format == nullptr) {
        throw std::runtime_error(name +
                                 " is not a trace: neither CSV with reference_ns and clock_ns, "
                                 "nor lines of ptp4l, phc2sys, ts2phc or refclocks.log");
    }
    format->finish(builder);
    return builder.finish(name, format->name());
}

} // namespace dravikHost
