#include "support/allocator.h"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>

// The linker sends malloc and free of this program's own objects here (--wrap).
extern "C" {
void* __real_malloc(size_t size);
void __real_free(void* block);
void* __wrap_malloc(size_t size) noexcept;
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

void __wrap_free(void* block) noexcept
{
    if (block != nullptr) ++freeCount;
    __real_free(block);
}

void* operator new(size_t size)
{
    void* const block = __wrap_malloc(size);
    if (block == nullptr) throw std::bad_alloc();
    return block;
}

void* operator new[](size_t size) { return operator new(size); }

void* operator new(size_t size, const std::nothrow_t& /*tag*/) noexcept
{
    return __wrap_malloc(size);
}

void* operator new[](size_t size, const std::nothrow_t& /*tag*/) noexcept
{
    return __wrap_malloc(size);
}

void operator delete(void* block) noexcept { __wrap_free(block); }

void operator delete[](void* block) noexcept { __wrap_free(block); }

void operator delete(void* block, size_t /*size*/) noexcept { __wrap_free(block); }

void operator delete[](void* block, size_t /*size*/) noexcept { __wrap_free(block); }

namespace allocator {

long allocations() { return allocationCount; }

long liveBlocks() { return allocationCount - freeCount; }

tFailNth::tFailNth(long n) { untilFailure = n; }

tFailNth::~tFailNth() { untilFailure = 0; }

bool tFailNth::fired() const { return untilFailure == 0; }

} // namespace allocator
