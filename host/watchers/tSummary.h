#pragma once

#include "loop/tStep.h"
#include "watchers/tConsole.h"

#include <array>
#include <optional>
#include <string>

namespace dravikHost {

// What is worth knowing of a whole run. Errors are those of all pairs from the first lock on,
// locked or not: against the true time where it is known, otherwise against the reference as
// measured.
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
    // The errors of some pairs, in ns.
    struct tErrors {
        int64_t pairs = 0;
        double squares = 0;
        double peak = 0;

        void add(double errorNs);
        std::string text() const;
    };

    void addCalls(const tHostCalls& calls, bool held);
    void addError(const tStep& step);
    std::string lockText() const;
    std::string errorText() const;
    std::string frequencyText() const;
    std::string callsText() const;
    std::string warningText() const;

    tConsole& console;
    bool dryRun = false;
    int64_t pairs = 0;
    int64_t heldBack = 0; // of them
    int64_t lastElapsedNs = 0;

    std::array<int64_t, kHostOperationNames.size()> callCounts{};
    double lowestPpb = 0; // of what was ordered
    double highestPpb = 0;
    std::optional<double> lastPpb;

    std::optional<int64_t> firstLockNs;
    bool locked = false;
    int64_t unlockedNs = 0; // since the first lock
    int64_t locksLost = 0;
    int64_t locksMissed = 0;

    bool againstTruth = false;
    tErrors sinceLock;
    tErrors whileLocked;
    double lastErrorNs = 0;
};

} // namespace dravikHost
