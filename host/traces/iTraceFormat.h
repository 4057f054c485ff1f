#pragma once

#include "traces/tRecordingBuilder.h"

#include <string>
#include <string_view>

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
