#include "tMedianReporter.h"

void tMedianReporter::ReportRuns(const std::vector<Run>& runs)
{
    for (const Run& run : runs) {
        if (run.run_type != Run::RT_Aggregate || run.aggregate_name != "median") continue;
        ConsoleReporter::ReportRuns({run});
        tResult& result = results[run.run_name.function_name];
        result.ns = run.GetAdjustedCPUTime();
        for (const auto& counter : run.counters) {
            result.counters[counter.first] = counter.second.value;
        }
    }
}

double tMedianReporter::ns(const std::string& name) const { return results.at(name).ns; }

double tMedianReporter::counter(const std::string& name, const std::string& counterName) const
{
    return results.at(name).counters.at(counterName);
}
