#pragma once

#include "traces/iTraceFormat.h"

namespace dravikHost {

// What ptp4l, phc2sys and ts2phc, and this program's own run, print for each measurement, with or
// without the prefix of a system log:
//
//     ptp4l[1234.567]: master offset        -23 s2 freq  -12345 path delay       500
//     Nov 23 08:35:26 host phc2sys: [1234.567] CLOCK_REALTIME phc offset  23 s2 freq +12 delay 500
//
// The offset is local minus reference, in ns. Freq is the correction, in ppb, that was applied with
// its sign turned; in state s1 the clock was also stepped by minus the offset.
class tDaemonLogFormat : public iTraceFormat
{
public:
    const char* name() const override { return "lines of ptp4l, phc2sys or ts2phc"; }
    bool recognises(std::string_view line) const override;
    std::string read(std::string_view line, tRecordingBuilder& builder) override;
};

} // namespace dravikHost
