#pragma once

#include "servo/tLockObserver.h"
#include "traces/iTraceFormat.h"

#include <array>
#include <optional>

namespace dravikHost {

// CSV with a header that names at least reference_ns and clock_ns, in any order. Also read are
// elapsed_s, true_error_ns, frequency_ppb (in force from this pair on), step_ns (by which the clock
// was stepped after it), and what this program writes: kind, call and value, the calls of each pair
// in rows of their own, and orders of a dry run, which did not reach the clock.
class tCsvFormat : public iTraceFormat
{
public:
    const char* name() const override { return "CSV"; }
    bool recognises(std::string_view line) const override;
    std::string read(std::string_view line, tRecordingBuilder& builder) override;
    void finish(tRecordingBuilder& builder) override;

private:
    enum tColumn {
        kReference,
        kClock,
        kElapsed,
        kTrueError,
        kFrequency,
        kStep,
        kKind,
        kCall,
        kValue,
        kColumns
    };
    using tFields = std::array<std::string_view, kColumns>;

    static int columnOf(std::string_view title);
    void readHeader(std::string_view line);
    tFields split(std::string_view line) const;
    std::string readPair(const tFields& fields, tRecordingBuilder& builder);
    std::string readCall(const tFields& fields, tRecordingBuilder& builder);
    void endPair(tRecordingBuilder& builder);

    std::vector<int> columns; // of the file's fields in turn; -1: not used
    bool hasCalls = false;
    tHostCalls calls; // of the last pair
    std::optional<tLockObserver> observer;
    int32_t lowestPpb = 0;
    int32_t highestPpb = 0;
    std::optional<double> orderedPpb;
    std::optional<double> initialPpb; // before anything was ordered
};

} // namespace dravikHost
