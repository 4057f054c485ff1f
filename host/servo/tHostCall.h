#pragma once

#include <array>
#include <cstdint>
#include <vector>

namespace dravikHost {

// The operations of a clock that the plug-in calls, in the order of the table.
enum tHostOperation {
    kGetTime,
    kStepTime,
    kGetFrequency,
    kSetFrequency,
    kGetMaxFrequencyOffset,
    kGetMinFrequencyOffset,
};

constexpr std::array<const char*, 6> kHostOperationNames = {
    "getTime",
    "stepTime",
    "getFrequency",
    "setFrequency",
    "getMaxFrequencyOffset",
    "getMinFrequencyOffset",
};

// Whether it changes the clock.
constexpr bool isOrder(tHostOperation operation)
{
    return operation == kStepTime || operation == kSetFrequency;
}

// Whether it is of the clock's rate, in ppb, and not of its time, in ns.
constexpr bool isOfFrequency(tHostOperation operation)
{
    return operation != kGetTime && operation != kStepTime;
}

struct tHostCall {
    tHostOperation operation;
    int64_t ns = 0; // given or returned: a time, or a step
    double ppb = 0; // or a frequency: an offset, or a limit of it
};

using tHostCalls = std::vector<tHostCall>;

// The first call of the operation, or null.
inline const tHostCall* findCall(const tHostCalls& calls, tHostOperation operation)
{
    for (const tHostCall& call : calls)
        if (call.operation == operation) return &call;
    return nullptr;
}

} // namespace dravikHost
