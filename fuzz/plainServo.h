#pragma once

#include "tScriptedHost.h"

#include <string>
#include <vector>

// The servo once more and as plainly as can be, for comparison: one record, one function for each
// call. Shares no code with the plug-in. Every function gives the code of its failure, or 0.

// The parameters, in the order of a document.
enum tPlainParameter {
    kFrequencyLockGain,
    kPhaseLockGain,
    kCoefficientA,
    kCoefficientB,
    kCoefficientC,
    kSnapTimeThreshold,
    kFilterEnabled,
    kHistorySize,
    kMaxThreshold,
    kMinThreshold,
    kGrowthFactor,
    kParameters
};

struct tPlainBounds {
    const char* key;
    double lowest;
    double highest;
    double initial;
};
extern const tPlainBounds kPlainBounds[kParameters];

// A member of a document, in the order of the text.
struct tPlainMember {
    int parameter;
    bool isNumber;
    double number;
};

enum tPlainState { kPlainFrequencyLock = 1, kPlainSnapTime, kPlainPhaseLock };

struct tPlainServo {
    explicit tPlainServo(tScriptedHost& clock);

    tScriptedHost& host;
    double parameter[kParameters]; // the flag is 0 or 1
    double maxOffset = 0.0;
    double minOffset = 0.0;
    tPlainState state = kPlainFrequencyLock;

    bool hasFirst = false; // frequency lock
    uint64_t firstReference = 0;
    uint64_t firstClock = 0;

    bool hasLast = false; // phase lock
    uint64_t lastReference = 0;
    double lastError = 0.0;

    std::vector<double> history; // spike filter, oldest first
    double historySum = 0.0;
    double lastOffset = 0.0;
    double threshold = 1.0;

    std::string referenceType;
    std::string log; // default files missed since the script emptied it
};

int32_t plainInitialize(tPlainServo& servo);
int32_t plainClearHistory(tPlainServo& servo);
int32_t plainAdjustTime(tPlainServo& servo, uint64_t reference, uint64_t clock);
int32_t plainGetTime(tPlainServo& servo, uint64_t& time);
int32_t plainWrite(tPlainServo& servo, const std::vector<tPlainMember>& document);
std::string plainRead(const tPlainServo& servo);
// Metadata that says this type of reference.
int32_t plainApplyType(tPlainServo& servo, const std::string& type);
