#include "support/faults.h"

#include <atomic>
#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>
#include <pthread.h>
#include <sys/auxv.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

std::atomic<bool> counting{false};
std::atomic<long> blocks{0};

// Of the thread that chose; nothing here may allocate.
thread_local bool armed = false;
thread_local faults::tKind chosen = faults::kAllocation;
thread_local long remaining = 0; // calls up to the one that fails; 0 or less: it has

bool failsNow(faults::tKind kind, int error)
{
    if (!faults::isDue(kind)) return false;
    errno = error;
    return true;
}

// The dynamic linker's own memory never fails, and is not counted: of a load that ends half way it
// leaves libraries behind that no later load can use, and its lists of libraries grow with time.
bool isDynamicLinker(const void* caller)
{
    Dl_info library = {};
    dladdr(caller, &library);
    return reinterpret_cast<uintptr_t>(library.dli_fbase) == getauxval(AT_BASE);
}

bool memoryFails(const void* caller)
{
    if (!armed || isDynamicLinker(caller)) return false;
    return failsNow(faults::kAllocation, ENOMEM) || failsNow(faults::kExhaustion, ENOMEM);
}

void* counted(void* block, const void* caller, long change)
{
    if (block != nullptr && counting && !isDynamicLinker(caller)) blocks += change;
    return block;
}

template <class Function> Function* next(Function* /*own*/, const char* name)
{
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

} // namespace

namespace faults {

tFault::tFault(tKind kind, long n)
{
    chosen = kind;
    remaining = n;
    armed = true;
}

tFault::~tFault() { armed = false; }

bool tFault::fired() const { return remaining <= 0; }

bool isDue(tKind kind)
{
    if (!armed || kind != chosen || (remaining <= 0 && kind != kExhaustion)) return false;
    return --remaining <= 0;
}

long liveBlocks()
{
#ifndef UNDER_ADDRESS_SANITIZER // which looks for leaks itself, and keeps blocks of its own
    counting = true;
#endif
    return blocks;
}

} // namespace faults

// The real function is looked up once for each; the address sanitizer's cannot be while it starts.
#define REAL(name) static const auto real = next(&(name), #name)
#ifdef UNDER_ADDRESS_SANITIZER
extern "C" {
decltype(malloc) __interceptor_malloc;
decltype(calloc) __interceptor_calloc;
decltype(realloc) __interceptor_realloc;
decltype(free) __interceptor_free;
}
#define REAL_MEMORY(name) const auto real = &__interceptor_##name
// Its leak check would look at the lists, too.
extern "C" const char* __lsan_default_suppressions() { return "leak:add_to_global_resize"; }
#else
#define REAL_MEMORY(name) REAL(name)
#endif

extern "C" {

void* malloc(size_t size) noexcept
{
    REAL_MEMORY(malloc);
    const void* const caller = __builtin_return_address(0);
    return memoryFails(caller) ? nullptr : counted(real(size), caller, +1);
}

void* calloc(size_t count, size_t size) noexcept
{
    REAL_MEMORY(calloc);
    const void* const caller = __builtin_return_address(0);
    return memoryFails(caller) ? nullptr : counted(real(count, size), caller, +1);
}

void* realloc(void* block, size_t size) noexcept
{
    REAL_MEMORY(realloc);
    const void* const caller = __builtin_return_address(0);
    if (memoryFails(caller)) return nullptr;
    return counted(real(block, size), caller, block == nullptr ? +1 : 0);
}

void free(void* block) noexcept
{
    REAL_MEMORY(free);
    real(counted(block, __builtin_return_address(0), -1));
}

int pthread_mutex_init(pthread_mutex_t* mutex, const pthread_mutexattr_t* attributes) noexcept
{
    REAL(pthread_mutex_init);
    return failsNow(faults::kMutex, EAGAIN) ? EAGAIN : real(mutex, attributes);
}

// The log of the machine stays clean.
void syslog(int /*priority*/, const char* /*format*/, ...) {}

#define FAILING(result, name, parameters, arguments, failure)                                      \
    result name parameters                                                                         \
    {                                                                                              \
        REAL(name);                                                                                \
        return failsNow(faults::kFile, EIO) ? (failure) : real arguments;                          \
    }
FAILING(FILE*, fopen, (const char* path, const char* mode), (path, mode), nullptr)
FAILING(FILE*, fopen64, (const char* path, const char* mode), (path, mode), nullptr)
FAILING(size_t, fread, (void* to, size_t size, size_t n, FILE* file), (to, size, n, file), 0)
FAILING(int, fseek, (FILE * file, long offset, int origin), (file, offset, origin), -1)
FAILING(long, ftell, (FILE * file), (file), -1)
FAILING(ssize_t, read, (int file, void* buffer, size_t size), (file, buffer, size), -1)
FAILING(int, fstat, (int file, struct stat* found) noexcept, (file, found), -1)
FAILING(int, stat64, (const char* path, struct stat64* found) noexcept, (path, found), -1)

} // extern "C"
