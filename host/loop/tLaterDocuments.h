#pragma once

#include "servo/tServoParameters.h"
#include "servo/tuning.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace dravikHost {

// A document for a servo that has been locked for some time.
struct tLaterDocument {
    int64_t afterNs; // from the moment of the lock
    std::string file;
};

// Another tuning that is to be in force from now on.
struct tTuningChange {
    tServoParameters parameters;
    std::string text; // what was done, for people
};

// Changes the tuning while the servo runs: quick gains to acquire the lock, quiet ones to hold it.
// A lost lock brings the first tuning back.
class tLaterDocuments
{
public:
    // In the order of their times. The servo, which is only asked what becomes of them, has the
    // first tuning. Throws std::runtime_error if a file cannot be read, or is refused.
    tLaterDocuments(tServoHost& servo, const std::vector<tLaterDocument>& options);

    const tServoParameters& first() const { return firstTuning; }
    double widestThreshold() const; // of all tunings, for snap time

    // What has no effect in a document, or another one than it seems.
    const tNotes& notes() const { return found; }

    // Mostly nothing.
    std::optional<tTuningChange> observe(int64_t elapsedNs, bool locked);

    // Goes on where others were that these replace: what is due is applied.
    void takeOver(const tLaterDocuments& others) { lockedSinceNs = others.lockedSinceNs; }

private:
    struct tDocument {
        tLaterDocument option;
        tServoParameters parameters; // with those of the documents before it
    };
    tNotes found;
    tServoParameters firstTuning;
    std::vector<tDocument> documents;
    size_t applied = 0;
    std::optional<int64_t> lockedSinceNs;
};

} // namespace dravikHost
