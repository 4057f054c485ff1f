#include "zvktl/err/vector.h"

namespace zvktl::err {

vector<char>::~vector()
{
    size = 0;
    release(data);
}

void vector<char>::insert(size_t position, size_t count, char value, zverr_Status* status)
{
    if (status->code < 0) return;
    if (count > SIZE_MAX - size) return reportMemoryFull(status);
    if (size + count <= capacity) {
        std::copy_backward(data + position, data + size, data + size + count);
        std::fill_n(data + position, count, value);
    } else {
        const size_t newCapacity = grownCapacity(capacity, size + count);
        char* const newData = static_cast<char*>(allocate(newCapacity, status));
        if (newData == nullptr) return;
        char* const gap = std::copy_n(data, position, newData);
        char* const behind = std::fill_n(gap, count, value);
        std::copy(data + position, data + size, behind);
        release(data);
        data = newData;
        capacity = newCapacity;
    }
    size += count;
}

} // namespace zvktl::err
