#pragma once

#include "loop/tStep.h"
#include "watchers/tConsole.h"

#include <array>
#include <string>

namespace dravikHost {

// What is worth knowing of a whole run. Errors count while locked only: against the true time where
// it is known, otherwise against the reference as measured.
class tSummary : public iStepObserver
{
public:
    explicit tSummary(tConsole& console) : console(console) {} // borrowed

    void begin(const std::string& scenario, const tHostCalls& calls) override;
    void see(const tStep& step) override;
    void end(const std::string& remarks) override;
    using iStepObserver::see;

    // Aligned lines, each with its end.
    std::string text() const;

private:
    void addCalls(const tHostCalls& calls);
    std::string lockText() const;
    std::string errorText() const;
    std::string frequencyText() const;
    std::string callsText() const;

    tConsole& console;
    int64_t pairs = 0;
    int64_t heldBack = 0; // of them
    int64_t lastElapsedNs = 0;
    std::array<int64_t, kHostOperationNames.size()> callCounts{};

    int64_t lockedPairs = 0;
    int64_t firstLockNs = 0;
    int64_t locksLost = 0;
    bool againstTruth = false;
    double squaresNs2 = 0;
    double peakNs = 0;
    double lastErrorNs = 0;

    int64_t lowestPpb = 0;
    int64_t highestPpb = 0;
    int64_t lastPpb = 0;
};

} // namespace dravikHost
