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

struct tHostCall {
    tHostOperation operation;
    int64_t value; // given or returned, in the operation's unit: nanoseconds or ppb
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
