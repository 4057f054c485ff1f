// All of operator new and delete in terms of malloc and free, which a test can have in its hands.

#include <cstddef>
#include <cstdlib>
#include <new>

void* operator new(size_t size)
{
    void* const block = malloc(size);
    if (block == nullptr) throw std::bad_alloc();
    return block;
}

void* operator new[](size_t size) { return operator new(size); }

void* operator new(size_t size, const std::nothrow_t& /*tag*/) noexcept { return malloc(size); }

void* operator new[](size_t size, const std::nothrow_t& /*tag*/) noexcept { return malloc(size); }

void operator delete(void* block) noexcept { free(block); }

void operator delete[](void* block) noexcept { free(block); }

void operator delete(void* block, size_t /*size*/) noexcept { free(block); }

void operator delete[](void* block, size_t /*size*/) noexcept { free(block); }
