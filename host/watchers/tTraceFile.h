#pragma once

#include "loop/tStep.h"
#include "text/files.h"

#include <optional>
#include <string>

namespace dravikHost {

// Every pair and every host call as one row of a CSV file, in the order they happened. What did not
// reach the clock in a dry run is an order held back, not a call.
class tTraceFile : public iStepObserver
{
public:
    explicit tTraceFile(const std::string& path); // "": none is written; "-": stdout

    void begin(const std::string& scenario, const tHostCalls& calls) override;
    void see(const tStep& step) override;
    void see(const tSilence& silence) override;
    void end(const std::string& remarks) override;

private:
    void addCalls(int64_t elapsedNs, const tHostCalls& calls, bool held);

    std::optional<tOutputFile> file;
};

} // namespace dravikHost
