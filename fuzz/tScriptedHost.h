#pragma once

#include <cstdint>
#include <cstdio>
#include <string>

// A clock that a fuzzer scripts. Notes every operation, and refuses one of them on demand. Two with
// the same script answer two servos alike for as long as these ask alike.
//
// Each operation gives the code that it reports: negative if refused.
struct tScriptedHost {
    int32_t getTime(uint64_t& time)
    {
        time = timeNs;
        return report("getTime");
    }
    int32_t stepTime(int64_t deltaNs)
    {
        const int32_t code = report("stepTime " + std::to_string(deltaNs));
        if (code >= 0) steppedNs += static_cast<uint64_t>(deltaNs);
        return code;
    }
    int32_t getFrequency(int32_t& ppb)
    {
        ppb = offsetPpb;
        return report("getFrequency");
    }
    int32_t setFrequency(int32_t ppb)
    {
        const int32_t code = report("setFrequency " + std::to_string(ppb));
        if (code >= 0) offsetPpb = ppb;
        return code;
    }
    int32_t getMaxFrequencyOffset(int32_t& ppb)
    {
        ppb = maxPpb;
        return report("getMaxFrequencyOffset");
    }
    int32_t getMinFrequencyOffset(int32_t& ppb)
    {
        ppb = minPpb;
        return report("getMinFrequencyOffset");
    }

    // What no clock sees: the ratio, to the last bit, behind the next setFrequency, and the state
    // that is entered.
    void noteRatio(double ratio)
    {
        char text[32];
        (void)std::snprintf(text, sizeof text, "%a", ratio);
        calls += std::string(", ratio ") + text;
    }
    void noteState(int state) { calls += ", state " + std::to_string(state); }

    std::string calls; // since the script emptied it
    int refused = 0;   // which of the next operations reports `code`, from 1; 0: none
    int32_t code = 0;

    uint64_t timeNs = 0;
    uint64_t steppedNs = 0; // sum of all steps, modulo 2^64
    int32_t offsetPpb = 0;
    int32_t maxPpb = 0;
    int32_t minPpb = 0;

private:
    int32_t report(const std::string& call)
    {
        calls += ", " + call;
        return refused > 0 && --refused == 0 ? code : 0;
    }
};
