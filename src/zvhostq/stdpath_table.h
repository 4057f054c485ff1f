#pragma once

#include "zverr/status.h"
#include "zvktl/err/string.h"
#include "zvktl/err/vector.h"

#include <cstddef>

namespace zvhostq {

// One standard directory: its name, as "bindir", and its path.
struct stdpath_entry {
    stdpath_entry() = default;
    stdpath_entry(const char* name, const char* value, zverr_Status* status)
        : name(name, status), value(value, status)
    {}
    stdpath_entry(const stdpath_entry& other, zverr_Status* status)
        : name(other.name, status), value(other.value, status)
    {}
    void swap(stdpath_entry& other) noexcept
    {
        name.swap(other.name);
        value.swap(other.value);
    }

    zvktl::err::string name;
    zvktl::err::string value;
};

static_assert(offsetof(stdpath_entry, value) == sizeof(zvktl::err::string), "the name comes first");
static_assert(sizeof(stdpath_entry) == 6 * sizeof(void*), "two strings");

// The relocation library's answer for a directory: positive, and the path in `buffer`,
// zero-terminated within `size` bytes; 0 for a directory that stays where it is; negative for a
// failure.
using tRelocate = int (*)(const char* name, char* buffer, size_t size);

// Where the standard directories of this installation lie: compiled-in defaults, overlaid by the
// answers of an optional relocation library. Built once, on first use, and only read afterwards.
class stdpath_table
{
public:
    // The one table. What went wrong in building it is copied into `status`, at every call.
    static const stdpath_table& instance(zverr_Status* status);

    // Assigns the path of the directory; zvplaterr_osFault for a name that is not there.
    void get(const zvktl::err::string& name, zvktl::err::string* value, zverr_Status* status) const;

private:
    explicit stdpath_table(zverr_Status* status);

    // Appends a row.
    void add(const char* name, const char* value, zverr_Status* status);
    // Overlays the defaults, if there is a relocation library.
    void relocateAll(zverr_Status* status);
    void relocateOne(const char* name, zverr_Status* status);
    // The first row of that name, or null.
    stdpath_entry* find(const char* name, size_t length) const;

    tRelocate relocate = nullptr; // called only while the library is open
    zvktl::err::vector<stdpath_entry> entries;
};

} // namespace zvhostq
