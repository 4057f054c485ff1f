#include "zvplat/tFixedStatusAdapter.h"

#include "zverr/jsonzLookup.h"
#include "zverr/jsonzString.h"

#include <algorithm>
#include <cstddef>

namespace {

// The last characters of a member, counted while still escaped, as plain text. Empty if there is no
// such string.
template <size_t Size> void readTail(const char* json, const char* key, char (&out)[Size])
{
    uint32_t length = 0;
    const char* const text = jsonz_getString(jsonz_findMember(json, key), "", &length, nullptr);
    const uint32_t taken = std::min<uint32_t>(length, Size - 1);
    jsonz_unescape(text + (length - taken), taken, out);
}

} // namespace

namespace zvplat {

tFixedStatusAdapter::tFixedStatusAdapter(zverr_Status* status) : status(status)
{
    if (status->code == 0) return;
    char component[sizeof record.component] = {};
    char file[sizeof record.file] = {};
    int32_t line = 0;
    if (status->json != nullptr) {
        readTail(status->json, "component", component);
        readTail(status->json, "file", file);
        line = jsonz_getInt(jsonz_findMember(status->json, "line"), 0, nullptr);
    }
    record.set(status->code, component, file, static_cast<uint32_t>(line));
}

tFixedStatusAdapter::~tFixedStatusAdapter()
{
    try {
        zverr_takeFixedStatus(record, status);
    } catch (...) { // NOLINT(bugprone-empty-catch): a host's reallocJson threw; the code is stored
    }
}

} // namespace zvplat
