#pragma once

#include "zverr/raisingSites.h"
#include "zverr/status.h"

namespace zvplat {

// The platform layer's own record of a failure: fixed arrays, no heap memory, no JSON, so that
// exhausted memory can be told in it too. Nothing in it needs releasing.
struct tFixedStatus {
    // The stamp of a record that has all fields, a fixed number and not its sizeof. A record with a
    // smaller stamp holds a code alone.
    static constexpr uint32_t kStamp = 164;

    // Sets the code by the rule of zverr_setCode, and with it the rest. True if it was taken. A
    // component keeps its first 9 characters; a file of more than 100 its first and its last 49,
    // with two dots in between.
    bool set(int32_t newCode, const char* newComponent, const char* newFile, uint32_t newLine);
    bool set(const zverr_RaisingSite& site);

    uint32_t size = kStamp;
    int32_t code = 0; // 0: nothing to report; negative: a failure; positive: a warning
    char component[10] = {};
    char file[101] = {}; // source unit
    uint32_t line = 0;
    uint32_t reserved = 0; // never read
};

static_assert(offsetof(tFixedStatus, code) == 4, "the stamp comes first");
static_assert(offsetof(tFixedStatus, component) == 8, "component at byte 8");
static_assert(offsetof(tFixedStatus, file) == 18, "file at byte 18");
static_assert(offsetof(tFixedStatus, line) == 120, "line at byte 120");
static_assert(offsetof(tFixedStatus, reserved) == 124, "reserved at byte 124");
static_assert(sizeof(tFixedStatus) == 128, "nothing else in the record");

} // namespace zvplat

// Carries what the record holds into a status, as far as there is room; a code of 0 is nothing.
void zverr_takeFixedStatus(const zvplat::tFixedStatus& fixed, zverr_Status* status);
