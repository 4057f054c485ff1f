#include "zvktl/err/string.h"

#include "zvktl/err/Allocator.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <utility>

namespace zvktl::err {

namespace {

constexpr size_t kSmallestCapacity = 127; // an allocation of 128 bytes

// What a string grows to when `wanted` characters do not fit: half as much again, unless that wraps
// around.
constexpr size_t grownCapacity(size_t capacity, size_t wanted)
{
    size_t newCapacity = std::max(wanted, kSmallestCapacity);
    const size_t grown = capacity + capacity / 2;
    if (grown > capacity) newCapacity = std::max(newCapacity, grown);
    return newCapacity;
}
static_assert(grownCapacity(0, 0) == 127 && grownCapacity(0, 200) == 200 &&
                  grownCapacity(127, 128) == 190 && grownCapacity(190, 191) == 285 &&
                  grownCapacity(285, 1000) == 1000 && grownCapacity(SIZE_MAX - 1, 1) == 127,
              "127, 190, 285, and what is asked for beyond");

} // namespace

string::string(const char* text, zverr_Status* status) : string(text, std::strlen(text), status) {}

string::string(const string& other, zverr_Status* status)
    : string(other.getText(), other.size, status)
{}

string::string(const char* text, size_t length, zverr_Status* status)
{
    reserve(length, status);
    if (status->code >= 0) store(text, length);
}

string::~string()
{
    release(data);
    data = nullptr;
    capacity = 0;
    size = 0;
}

void string::reserve(size_t wanted, zverr_Status* status)
{
    if (capacity >= wanted && capacity != 0) return;
    const size_t newCapacity = grownCapacity(capacity, wanted);
    if (newCapacity == SIZE_MAX) return reportMemoryFull(status);
    if (status->code < 0) return;

    char* const newData = static_cast<char*>(allocate(newCapacity + 1, status));
    if (newData == nullptr) return;
    std::memcpy(newData, getText(), size);
    newData[size] = 0;
    release(data);
    data = newData;
    capacity = newCapacity;
}

void string::assign(const char* text, size_t length, zverr_Status* status)
{
    if (status->code < 0) return;
    if (length > capacity) {
        string replacement(text, length, status);
        if (status->code >= 0) swap(replacement);
    } else if (data != nullptr) {
        store(text, length);
    }
}

void string::swap(string& other) noexcept
{
    std::swap(data, other.data);
    std::swap(capacity, other.capacity);
    std::swap(size, other.size);
}

// The text fits, and may be a part of this one.
void string::store(const char* text, size_t length)
{
    if (length != 0) std::memmove(data, text, length);
    data[length] = 0;
    size = length;
}

} // namespace zvktl::err
