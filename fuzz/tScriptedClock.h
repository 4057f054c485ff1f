#pragma once

#include <cstdint>
#include <vector>

// A clock whose operations are noted and can be told to fail. A failing one throws its code.
struct tScriptedClock {
    struct tNote {
        char operation;
        int64_t argument;
        bool operator==(const tNote& other) const
        {
            return operation == other.operation && argument == other.argument;
        }
    };

    uint64_t getTime() { return note('t', 0), timeNs; }
    void stepTime(int64_t deltaNs) { note('s', deltaNs); }
    int32_t getFrequency() { return note('g', 0), offsetPpb; }
    void setFrequency(int32_t ppb)
    {
        note('f', ppb);
        offsetPpb = ppb;
    }
    int32_t getMaxFrequencyOffset() { return note('M', 0), maxPpb; }
    int32_t getMinFrequencyOffset() { return note('m', 0), minPpb; }

    void note(char operation, int64_t argument)
    {
        notes.push_back({operation, argument});
        if (--untilFailure == 0) throw failure;
    }

    std::vector<tNote> notes;
    uint64_t timeNs = 0;
    int32_t offsetPpb = 0;
    int32_t maxPpb = 500000;
    int32_t minPpb = -500000;
    int untilFailure = 0; // operations up to the one that fails; 0 or less: none
    int32_t failure = -1;
};
