#pragma once

#include <benchmark/benchmark.h>
#include <map>
#include <string>
#include <vector>

// The usual console table, but for the medians only, and a record of them for a comparison.
class tMedianReporter : public benchmark::ConsoleReporter
{
public:
    tMedianReporter() : ConsoleReporter(OO_None) {}

    void ReportRuns(const std::vector<Run>& runs) override;

    size_t size() const { return results.size(); }
    double ns(const std::string& name) const; // per iteration
    double counter(const std::string& name, const std::string& counterName) const;

private:
    struct tResult {
        double ns;
        std::map<std::string, double> counters;
    };
    std::map<std::string, tResult> results;
};
