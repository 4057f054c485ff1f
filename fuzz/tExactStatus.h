#pragma once

#include "require.h"
#include "support/hostParts.h"
#include "zverr/jsonz.h"
#include "zverr/status.h"

#include <algorithm>
#include <cstring>

// A host's own status: its reallocJson gives exactly what is asked, in a fresh allocation, so that
// a sanitizer sees any step out of it, and only up to a limit.
struct tExactStatus : zverr_Status {
    explicit tExactStatus(uint32_t largest = UINT32_MAX) : zverr_Status(), largestBuffer(largest)
    {
        reallocJson = limitedReallocJson;
    }
    tExactStatus(const tExactStatus&) = delete;
    tExactStatus& operator=(const tExactStatus&) = delete;
    ~tExactStatus()
    {
        requireForm();
        exactReallocJson(this, 0);
    }

    void requireForm() const
    {
        if (json == nullptr) return;
        const char* const first = json;
        const char* const last = first + capacity - 1;
        REQUIRE(*last == kJsonzEndMark);
        REQUIRE(std::all_of(first + std::strlen(first), last, [](char c) { return c == 0; }));
    }

    uint32_t largestBuffer;

private:
    static bool limitedReallocJson(zverr_Status* status, uint32_t size)
    {
        if (size > static_cast<tExactStatus*>(status)->largestBuffer) return false;
        return exactReallocJson(status, size);
    }
};
