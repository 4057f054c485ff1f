#include "support/allocator.h"

#include <atomic>
#include <cstddef>
#include <cstdlib>

// The linker sends malloc, calloc and free of this program's own objects here (--wrap). A compiler
// may make a calloc of a malloc and a memset, so each counts, and fails, as the other does.
extern "C" {
void* __real_malloc(size_t size);
void* __real_calloc(size_t count, size_t size);
void __real_free(void* block);
void* __wrap_malloc(size_t size) noexcept;
void* __wrap_calloc(size_t count, size_t size) noexcept;
void __wrap_free(void* block) noexcept;
}

namespace {

std::atomic<long> allocationCount{0};
std::atomic<long> freeCount{0};
std::atomic<long> untilFailure{0}; // 0: off

bool mustFail() { return untilFailure.load() > 0 && untilFailure.fetch_sub(1) == 1; }

} // namespace

void* __wrap_malloc(size_t size) noexcept
{
    if (mustFail()) return nullptr;
    ++allocationCount;
    return __real_malloc(size);
}

void* __wrap_calloc(size_t count, size_t size) noexcept
{
    if (mustFail()) return nullptr;
    ++allocationCount;
    return __real_calloc(count, size);
}

void __wrap_free(void* block) noexcept
{
    if (block != nullptr) ++freeCount;
    __real_free(block);
}

namespace allocator {

long allocations() { return allocationCount; }

long liveBlocks() { return allocationCount - freeCount; }

tFailNth::tFailNth(long n) { untilFailure = n; }

tFailNth::~tFailNth() { untilFailure = 0; }

bool tFailNth::fired() const { return untilFailure == 0; }

} // namespace allocator
