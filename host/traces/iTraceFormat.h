#pragma once

#include "traces/tRecordingBuilder.h"

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace dravikHost {

// One way in which traces are written, line by line.
class iTraceFormat
{
public:
    virtual ~iTraceFormat() = default;

    virtual const char* name() const = 0; // in words

    // Whether the line belongs to this format and to no other.
    virtual bool recognises(std::string_view line) const = 0;

    // Takes one line; returns why it is no measurement, "" if it is one or belongs to the frame.
    virtual std::string read(std::string_view line, tRecordingBuilder& builder) = 0;

    // All lines have been taken.
    virtual void finish(tRecordingBuilder& /*builder*/) {}
};

// Logs tell differences of time and moments of their own. Their references start here, so that no
// difference, however negative, takes a clock below zero.
constexpr uint64_t kMadeUpStartNs = 1'700'000'000'000'000'000;

// The formats that there are, each in the file of its name.
std::unique_ptr<iTraceFormat> csvFormat();
std::unique_ptr<iTraceFormat> daemonLogFormat();
std::unique_ptr<iTraceFormat> refclocksLogFormat();

} // namespace dravikHost
