#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <stdexcept>

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

// Those of one pair, in turn. There are few, and they need no memory of their own.
class tHostCalls
{
public:
    tHostCalls() = default;
    tHostCalls(std::initializer_list<tHostCall> calls)
    {
        for (const tHostCall& call : calls)
            push_back(call);
    }

    bool isFull() const { return count == all.size(); }

    // Throws std::length_error if it is full.
    void push_back(const tHostCall& call)
    {
        if (isFull()) throw std::length_error("more calls than a pair can have");
        all[count++] = call;
    }
    void append(const tHostCalls& others)
    {
        for (const tHostCall& call : others)
            push_back(call);
    }
    void clear() { count = 0; }

    bool empty() const { return count == 0; }
    size_t size() const { return count; }
    const tHostCall& back() const { return all[count - 1]; }
    const tHostCall& operator[](size_t index) const { return all[index]; }
    const tHostCall* begin() const { return all.data(); }
    const tHostCall* end() const { return all.data() + count; }

private:
    std::array<tHostCall, 8> all{}; // the servo makes three at most, and self-tuning before it two
    size_t count = 0;
};

// The first call of the operation, or null.
inline const tHostCall* findCall(const tHostCalls& calls, tHostOperation operation)
{
    for (const tHostCall& call : calls)
        if (call.operation == operation) return &call;
    return nullptr;
}

} // namespace dravikHost
