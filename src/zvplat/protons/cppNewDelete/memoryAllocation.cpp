#include "zvplat/protons/cppNewDelete/memoryAllocation.h"

#include <new>

namespace zvplat {

char* newArray(size_t size, tFixedStatus* status)
{
    if (status->code < 0) return nullptr;
    char* const array = new (std::nothrow) char[size];
    if (array == nullptr) status->set(zverr::kAtNewArray);
    return array;
}

} // namespace zvplat
