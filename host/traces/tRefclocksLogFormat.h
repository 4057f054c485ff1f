#pragma once

#include "traces/iTraceFormat.h"

namespace dravikHost {

// chrony's refclocks.log, one line a measurement:
//
//     2026-11-23 14:33:27.000000 PPS0    7 N 1  4.900000e-07 -6.741777e-07  1.000e-06
//
// with date and time, the name of the reference clock, its place in the polling interval, leap
// status, pulse, raw offset, cooked offset, dispersion. Cooked is corrected by the configured
// offset; it is in seconds and positive if the local clock is slow. Lines with "-" in place of the
// place are what the filter made of several measurements. What was done to the clock is told
// elsewhere.
class tRefclocksLogFormat : public iTraceFormat
{
public:
    const char* name() const override { return "chrony's refclocks.log"; }
    bool recognises(std::string_view line) const override;
    std::string read(std::string_view line, tRecordingBuilder& builder) override;
};

} // namespace dravikHost
