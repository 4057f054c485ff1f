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

// What a line turned out to be. The order tells how much it speaks for the format.
struct tLine {
    enum tKind { kUnread, kEvent, kFrame, kMeasurement } kind;
    std::string why; // of what is unread

    static tLine unread(std::string why) { return {kUnread, std::move(why)}; }
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
