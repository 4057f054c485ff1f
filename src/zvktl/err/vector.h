#pragma once

#include "zvktl/err/Allocator.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <new>
#include <utility>

namespace zvktl::err {

// What both vectors grow to when `needed` elements no longer fit: half as much again, 8 at least.
constexpr size_t grownCapacity(size_t capacity, size_t needed)
{
    return std::max({capacity + capacity / 2, size_t{8}, needed});
}
static_assert(grownCapacity(0, 1) == 8 && grownCapacity(8, 9) == 12 &&
                  grownCapacity(12, 13) == 18 && grownCapacity(18, 19) == 27 &&
                  grownCapacity(27, 100) == 100,
              "one by one: 8, 12, 18, 27");

// An owned array of elements. What can allocate takes a status, as in err::string. An element is
// all zero when value-initialised, has swap(Element&) and the constructor
// Element(const Element&, zverr_Status*), which leaves an element that can be destroyed even where
// it fails; nothing of it throws.
template <class Element> struct vector {
    // The size in bytes of this many elements of 24 bytes, which they have on a 32-bit target, just
    // fits 32 bits. It is the limit on every machine.
    static constexpr size_t kLargestCapacity = 178956970;

    vector() = default;
    ~vector();
    vector(const vector&) = delete;
    vector& operator=(const vector&) = delete;

    // Makes room for `count` zeroed elements at index `position`. It does not change `size`: the
    // caller swaps its elements into the gap and adds them to `size` right away.
    void open_gap(size_t position, size_t count, zverr_Status* status);
    // Destroys the elements and keeps the array.
    void clear();

    size_t capacity = 0; // elements that fit
    size_t size = 0;     // elements held
    Element* data = nullptr;

private:
    void openInPlace(size_t position, size_t count);
    void openInNewArray(size_t position, size_t count, zverr_Status* status);
};

// An owned array of bytes.
template <> struct vector<char> {
    vector() = default;
    ~vector();
    vector(const vector&) = delete;
    vector& operator=(const vector&) = delete;

    // Inserts `count` copies of a byte before index `position`.
    void insert(size_t position, size_t count, char value, zverr_Status* status);

    size_t capacity = 0; // bytes that fit
    size_t size = 0;     // bytes held
    char* data = nullptr;
};

static_assert(offsetof(vector<char>, size) == sizeof(void*), "capacity comes first");
static_assert(offsetof(vector<char>, data) == 2 * sizeof(void*), "data comes last");

template <class Element> vector<Element>::~vector()
{
    clear();
    release(data);
}

template <class Element>
void vector<Element>::open_gap(size_t position, size_t count, zverr_Status* status)
{
    if (status->code < 0) return;
    if (count > SIZE_MAX - size) return reportMemoryFull(status);
    if (size + count <= capacity) {
        openInPlace(position, count);
    } else {
        openInNewArray(position, count, status);
    }
}

template <class Element> void vector<Element>::openInPlace(size_t position, size_t count)
{
    for (size_t i = size; i < size + count; ++i) {
        new (data + i) Element();
    }
    for (size_t i = size; i > position; --i) {
        data[i - 1].swap(data[i - 1 + count]);
    }
}

template <class Element>
void vector<Element>::openInNewArray(size_t position, size_t count, zverr_Status* status)
{
    static_assert(kLargestCapacity <= SIZE_MAX / sizeof(Element), "a size in bytes is a size_t");
    const size_t newCapacity = grownCapacity(capacity, size + count);
    if (newCapacity > kLargestCapacity) return reportMemoryFull(status);
    void* const memory = allocate(newCapacity * sizeof(Element), status);
    if (memory == nullptr) return;

    vector grown; // takes the old array's place, or the copies with it
    grown.data = static_cast<Element*>(memory);
    grown.capacity = newCapacity;
    for (size_t i = 0; i < size + count; ++i) {
        void* const place = grown.data + i;
        if (i < position) {
            new (place) Element(data[i], status);
        } else if (i < position + count) {
            new (place) Element();
        } else {
            new (place) Element(data[i - count], status);
        }
        ++grown.size;
    }
    if (status->code < 0) return;
    std::swap(data, grown.data);
    std::swap(capacity, grown.capacity);
    grown.size = size;
}

template <class Element> void vector<Element>::clear()
{
    for (size_t i = 0; i < size; ++i) {
        data[i].~Element();
    }
    size = 0;
}

} // namespace zvktl::err
