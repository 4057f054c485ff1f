#pragma once

#include "traces/tRecordingBuilder.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace dravikHost {

// What a line turned out to be.
struct tLine {
    enum tKind {
        kForeign,     // nothing that the format has
        kUnread,      // like a measurement, but damaged
        kEvent,       // what such a log tells beside measurements
        kFrame,       // a header, a banner, a blank line
        kMeasurement, // or a summary of several
    } kind;
    std::string why; // it is no measurement; may be "" of an event or a frame

    static tLine foreign(std::string why) { return {kForeign, std::move(why)}; }
    static tLine unread(std::string why) { return {kUnread, std::move(why)}; }
    // What a builder made of it: the reason why it cannot be used, "" if it can.
    static tLine added(std::string why)
    {
        return {why.empty() ? kMeasurement : kUnread, std::move(why)};
    }
};

// One way in which traces are written, line by line. Which one a file has shows in how many of its
// lines can be read.
class iTraceFormat
{
public:
    virtual ~iTraceFormat() = default;

    virtual std::string name() const = 0; // in words

    virtual tLine read(std::string_view line, tRecordingBuilder& builder) = 0;

    // All lines have been taken.
    virtual void finish(tRecordingBuilder& /*builder*/) {}
};

// The formats that there are, each made anew, in the order in which they are preferred.
using tMakeFormat = std::function<std::unique_ptr<iTraceFormat>(const tReadOptions& options)>;
void addCsvFormat(std::vector<tMakeFormat>& formats);
void addDaemonLogFormat(std::vector<tMakeFormat>& formats);
void addShapedFormats(std::vector<tMakeFormat>& formats);
void addOtherDaemonFormats(std::vector<tMakeFormat>& formats);
void addColumnsFormat(std::vector<tMakeFormat>& formats);

} // namespace dravikHost
