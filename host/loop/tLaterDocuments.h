#pragma once

#include "servo/tServoHost.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

// A document for a servo that has been locked for some time.
struct tLaterDocument {
    int64_t afterNs; // from the moment of the lock
    std::string file;
};

// Changes the tuning while the servo runs: quick gains to acquire the lock, quiet ones to hold it.
// A lost lock brings the first tuning back.
class tLaterDocuments
{
public:
    // In the order of their times. The servo is borrowed and has its first tuning. Throws
    // std::runtime_error if a file cannot be read, or is refused.
    tLaterDocuments(tServoHost& servo, const std::vector<tLaterDocument>& documents);

    // Returns what was done, for people; mostly "".
    std::string observe(int64_t elapsedNs, bool locked);

private:
    struct tDocument {
        tLaterDocument option;
        std::string text;
    };
    tServoHost* host;
    std::string firstTuning;
    std::vector<tDocument> documents;
    size_t applied = 0;
    std::optional<int64_t> lockedSinceNs;
};
