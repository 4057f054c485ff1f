#include "zvplat/quarks/synchronization.h"

namespace {

bool create(pthread_mutex_t* mutex)
{
    pthread_mutexattr_t attributes;
    if (pthread_mutexattr_init(&attributes) != 0) return false; // unreached: glibc's never fails
    bool created = false;
    // unreached: refused, as every system with these attributes knows the type
    if (pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_RECURSIVE) == 0) {
        // Without priority inheritance the mutex still does its work.
        (void)pthread_mutexattr_setprotocol(&attributes, PTHREAD_PRIO_INHERIT);
        created = pthread_mutex_init(mutex, &attributes) == 0;
    }
    pthread_mutexattr_destroy(&attributes);
    return created;
}

} // namespace

tMutex::tMutex(zvplat::tFixedStatus* status) : created(create(&mutex))
{
    if (!created) status->set(zverr::kAtMutexCreation);
}

tMutex::~tMutex()
{
    if (!created) return;
    pthread_mutex_destroy(&mutex);
    created = false;
}
