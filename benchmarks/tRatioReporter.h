#pragma once

#include <benchmark/benchmark.h>
#include <map>
#include <string>

// The usual console table, and a record of every time for the comparison behind it.
class tRatioReporter : public benchmark::ConsoleReporter
{
public:
    void ReportRuns(const std::vector<Run>& runs) override;

    size_t size() const { return results.size(); }
    double ns(const std::string& name) const; // per iteration; the median if there were repetitions
    double counter(const std::string& name, const std::string& counterName) const;

private:
    struct tResult {
        double ns;
        std::map<std::string, double> counters;
    };
    std::map<std::string, tResult> results;
};
