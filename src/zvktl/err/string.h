#pragma once

#include "zverr/status.h"

#include <cstddef>

namespace zvktl::err {

// An owned, zero-terminated byte string. What can allocate takes a status, does nothing if that has
// a failure already, and leaves the string as it was if there is no memory; so a chain of calls
// needs one look at the status, at its end. Belongs to one thread at a time.
class string
{
public:
    string() = default; // empty, nothing allocated
    string(const char* text, zverr_Status* status);
    string(const string& other, zverr_Status* status);
    ~string();
    string(const string&) = delete;
    string& operator=(const string&) = delete;

    // Makes sure that `wanted` characters fit.
    void reserve(size_t wanted, zverr_Status* status);
    // Replaces the contents.
    void assign(const char* text, size_t length, zverr_Status* status);
    void swap(string& other) noexcept;

    const char* getText() const { return data != nullptr ? data : ""; }
    size_t getCapacity() const { return capacity; }
    size_t getSize() const { return size; }

private:
    string(const char* text, size_t length, zverr_Status* status);

    void store(const char* text, size_t length);

    char* data = nullptr; // capacity + 1 bytes, with a zero behind the text; null: never allocated
    size_t capacity = 0;  // characters that fit, the zero not counted
    size_t size = 0;      // characters held
};

static_assert(sizeof(string) == 3 * sizeof(void*), "three words");

} // namespace zvktl::err
