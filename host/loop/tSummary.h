#pragma once

#include "loop/tLockObserver.h"
#include "servo/tHostCall.h"
#include "sources/iPairSource.h"

#include <array>
#include <string>

// What is worth knowing of a whole run. Errors count while locked only: against the true time where
// it is known, otherwise against the reference as measured.
class tSummary
{
public:
    void addLostLock() { ++locksLost; } // by the host's own will
    void addCalls(const tHostCalls& calls);
    void addHeldBack(const tPair& pair);
    void addPair(const tPair& pair, tLockEvent event, bool locked);

    int64_t pairsTaken() const { return pairs - heldBack; }
    int64_t lostLocks() const { return locksLost; }
    int64_t steps() const { return callCounts[kStepTime]; }
    double orderedPpb() const { return static_cast<double>(lastPpb); }

    // Aligned lines, each with its end.
    std::string text() const;

private:
    std::string lockText() const;
    std::string errorText() const;
    std::string frequencyText() const;
    std::string callsText() const;

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
