#pragma once

#include "loop/tMetricsFile.h"
#include "loop/tReport.h"
#include "loop/tRunningFigures.h"

#include <optional>
#include <string>

// What a run tells those who watch it: status lines in the manner of the field's tools, and figures
// for a monitoring agent.
//
//     dravik-host[12.345]: offset        -23 s2 freq  +12345
//     dravik-host[60.000]: rms   23 max   45 freq  +12345 +/-   12
//     dravik-host[90.000]: holdover for 20 s, error about 34 ns
//
// The offset is clock minus reference in ns; s0 is not locked, s1 is stepped
// onto the reference, s2 is locked; freq is, in ppb, what
// the clock was found to be fast by, which is minus what is in force.
class tRunMonitor
{
public:
    struct tOptions {
        std::optional<int64_t> statusIntervalNs; // 0: a line for each pair
        std::string metricsFile;
    };

    explicit tRunMonitor(const tOptions& given) : options(given), metrics(given.metricsFile) {}

    struct tState {
        bool locked = false;
        bool stepped = false; // after this pair
        double inForcePpb = 0;
        std::optional<double> holdoverErrorNs;
        int64_t holdoverNs = 0;
        int64_t pairs = 0;
        int64_t locksLost = 0;
        int64_t steps = 0;
    };

    void pair(const tPair& pair, const tState& state, tReport& report);
    void silence(int64_t elapsedNs, const tState& state, tReport& report);

private:
    void printStatus(const tPair& pair, const tState& state, tReport& report);
    void printSilence(int64_t elapsedNs, const tState& state, tReport& report);
    void writeMetrics(int64_t elapsedNs, const tState& state, tReport& report);
    std::vector<tMetric> figuresOf(const tState& state) const;

    tOptions options;
    tMetricsFile metrics;
    tRunningFigures figures; // since the last line
    std::optional<int64_t> lineNs;
    std::optional<int64_t> metricsNs;
    bool metricsFail = false; // as was told
    double latestErrorNs = 0;
};
