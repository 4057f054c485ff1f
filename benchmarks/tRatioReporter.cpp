#include "tRatioReporter.h"

void tRatioReporter::ReportRuns(const std::vector<Run>& runs)
{
    ConsoleReporter::ReportRuns(runs);
    for (const Run& run : runs) {
        if (run.run_type == Run::RT_Aggregate && run.aggregate_name != "median") continue;
        tResult& result = results[run.run_name.function_name];
        result.ns = run.GetAdjustedCPUTime();
        for (const auto& counter : run.counters) {
            result.counters[counter.first] = counter.second.value;
        }
    }
}

double tRatioReporter::ns(const std::string& name) const { return results.at(name).ns; }

double tRatioReporter::counter(const std::string& name, const std::string& counterName) const
{
    return results.at(name).counters.at(counterName);
}
