#pragma once

#include <pthread.h>

// Holds the cancellation of the calling thread off for a scope. A cancelled thread unwinds its
// stack in a way that no handler may end, which would abort the process where an exception is
// turned into a status, and would leave work half done elsewhere. A request that comes meanwhile
// stays pending and takes effect at the thread's next cancellation point.
class tCancellationPause
{
public:
    tCancellationPause() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &before); }
    ~tCancellationPause() { pthread_setcancelstate(before, nullptr); }
    tCancellationPause(const tCancellationPause&) = delete;
    tCancellationPause& operator=(const tCancellationPause&) = delete;

private:
    int before = PTHREAD_CANCEL_ENABLE;
};
