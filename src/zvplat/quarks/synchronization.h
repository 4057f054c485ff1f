#pragma once

#include "zvplat/tFixedStatus.h"

#include <pthread.h>

// A recursive, priority-inheriting mutex. Recursive because a servo's states call back into the
// servo under its lock; priority-inheriting because hosts feed clocks from real-time threads.
class tMutex
{
public:
    // A mutex that the system refused is told in `status`. Should the owner live on, it can be
    // locked all the same, but does not inherit priorities.
    explicit tMutex(zvplat::tFixedStatus* status);
    ~tMutex();
    tMutex(const tMutex&) = delete;
    tMutex& operator=(const tMutex&) = delete;

    void lock() { pthread_mutex_lock(&mutex); }
    void unlock() { pthread_mutex_unlock(&mutex); }

private:
    friend class tMutexGuard;

    pthread_mutex_t mutex = PTHREAD_RECURSIVE_MUTEX_INITIALIZER_NP;
    bool created;
};

// Holds a mutex for a scope. Its owner must outlive it.
class tMutexGuard
{
public:
    explicit tMutexGuard(tMutex& owner) : mutex(&owner.mutex) { pthread_mutex_lock(mutex); }
    ~tMutexGuard() { pthread_mutex_unlock(mutex); }
    tMutexGuard(const tMutexGuard&) = delete;
    tMutexGuard& operator=(const tMutexGuard&) = delete;

private:
    pthread_mutex_t* mutex;
};
