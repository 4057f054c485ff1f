#pragma once

#include "loop/tStep.h"
#include "watchers/tConsole.h"

#include <string>

namespace dravikHost {

// What happens, in words, while it happens.
class tReport : public iStepObserver
{
public:
    explicit tReport(tConsole& console) : console(console) {} // borrowed

    void begin(const std::string& scenario, const tHostCalls& calls) override;
    void see(const tStep& step) override;
    void see(const tSilence& silence) override;
    void note(int64_t elapsedNs, const std::string& text) override;
    void end(const std::string& remarks) override;

private:
    tConsole& console;
};

} // namespace dravikHost
