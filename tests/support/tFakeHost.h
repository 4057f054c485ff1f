#pragma once

#include "support/tHostStatus.h"
#include "support/tOpenServo.h"
#include "zvckmservo/servo.h"

#include <cstdint>
#include <functional>
#include <string>

// A host with one clock that a test scripts: what the clock answers, which of its operations fails
// and how. Notes every operation as text, for example "get set -110" for a pair in phase lock.
class tFakeHost
{
public:
    tFakeHost();
    ~tFakeHost();
    tFakeHost(const tFakeHost&) = delete;
    tFakeHost& operator=(const tFakeHost&) = delete;

    // The exported functions on this host's table. Each call starts with a fresh status.
    void initialize();
    // As initialize, but gives the servo behind the table, which finalize ends as usual.
    tOpenServo& open();
    void pair(uint64_t referenceTime, uint64_t clockTime);
    void clearHistory();

    int32_t code() const { return status.code(); }
    // The operations noted since the last call of this.
    std::string takeCalls();

    zvckmservo_HostTable table;
    tHostStatus status;

    uint64_t timeNs = 0;
    int32_t offsetPpb = 0; // follows setFrequency
    int32_t maxPpb = 500000;
    int32_t minPpb = -500000;
    // Run in every operation, with the operation's name and status; may store a code, may throw.
    std::function<void(const std::string& operation, zverr_Status* status)> inOperation;
    // The named operation reports -77 with the payload {"clock":"broken"}; no other does.
    void failIn(const std::string& operation);

private:
    void answer(const std::string& operation, const std::string& note,
                zverr_Status* operationStatus);

    std::string calls;

    friend struct tFakeOperations;
};
