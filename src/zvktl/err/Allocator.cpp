#include "zvktl/err/Allocator.h"

#include "zverr/payload.h"

#include <new>

namespace zvktl::err {

void* allocate(size_t bytes, zverr_Status* status)
{
    void* const memory = ::operator new(bytes, std::nothrow);
    if (memory == nullptr) reportMemoryFull(status);
    return memory;
}

void release(void* memory) { ::operator delete(memory); }

void reportMemoryFull(zverr_Status* status) { zverr_setFailure(status, zverr::kAtAllocator); }

} // namespace zvktl::err
