/* How programs read the time and wait for it. Descriptors are real ones: whether they are ready is
 * asked without waiting whenever something may have happened. */
#include "machine.h"

#include <limits.h>
#include <poll.h>
#include <signal.h>
#include <sys/epoll.h>
#include <sys/select.h>
#include <sys/time.h>
#include <unistd.h>

struct machine* machine(void)
{
    static struct machine made;
    static int isMade;
    if (!isMade) {
        isMade = 1;
        configure(&made);
        lockUp(made.emulated);
        advance(0);
    }
    return &made;
}

/* Programs that it starts are in the real world, but still cannot set its clocks. */
__attribute__((constructor)) static void begin(void)
{
    (void)machine();
    (void)unsetenv("LD_PRELOAD");
}

static int64_t nsOf(const struct timespec* time)
{
    return (int64_t)time->tv_sec * kSecondNs + time->tv_nsec;
}

static struct timespec timespecOf(int64_t ns)
{
    return (struct timespec){(time_t)(ns / kSecondNs), (long)(ns % kSecondNs)};
}

/* A device file that a program opened is numbered by its descriptor. */
struct clock* clockOfId(clockid_t id)
{
    enum { kOfDescriptor = 3 };
    if (id < 0) return (id & 7) == kOfDescriptor ? clockOfFile(~(id >> 3)) : NULL; /* NOLINT */
    const int ofProcessor = id == CLOCK_PROCESS_CPUTIME_ID || id == CLOCK_THREAD_CPUTIME_ID;
    return ofProcessor ? NULL : &machine()->clocks[0];
}

/* Monotonic clocks begin at an hour. */
static int64_t readingOf(clockid_t id, struct clock* clock)
{
    const int64_t hourNs = 3600LL * kSecondNs;
    if (id < 0)
        return cutStamp(&clock->reading, timeOf(clock) + measurementErrorNs(&clock->reading));
    if (id == CLOCK_MONOTONIC_RAW) return hourNs + clock->raw.wholeNs;
    if (id == CLOCK_REALTIME || id == CLOCK_REALTIME_COARSE || id == CLOCK_REALTIME_ALARM)
        return timeOf(clock);
    if (id == CLOCK_TAI) return timeOf(clock) + (int64_t)machine()->taiS * kSecondNs;
    return hourNs + clock->steered.wholeNs;
}

int clock_gettime(clockid_t id, struct timespec* time)
{
    struct clock* const clock = clockOfId(id);
    if (!clock && id < 0) return fail(EINVAL);
    if (!clock) return NEXT(clock_gettime)(id, time);
    if (id < 0 && clock->silent) return fail(EIO);
    advance((int64_t)(id < 0 ? clock->delayNs : machine()->readingNs));
    *time = timespecOf(readingOf(id, clock));
    return 0;
}

int gettimeofday(struct timeval* restrict time, void* restrict zone)
{
    struct timespec now = {0, 0};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    *time = (struct timeval){now.tv_sec, (suseconds_t)(now.tv_nsec / 1000)};
    if (zone) memset(zone, 0, sizeof(struct timezone));
    return 0;
}

time_t time(time_t* seconds)
{
    struct timespec now = {0, 0};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    if (seconds) *seconds = now.tv_sec;
    return now.tv_sec;
}

static const int64_t kForever = INT64_MAX;
static const int64_t kLookNs = 1000; /* what a look without waiting takes */
typedef int tReady(void* what);      /* as the call returns it; 0: nothing yet */

/* Waits so long by the machine's clock. Returns what ready does, 0 when the time is over, -1 when a
 * signal came before; leftNs: what is left then. */
static int waitFor(int64_t ns, tReady* ready, void* what, int64_t* leftNs)
{
    struct machine* const now = machine();
    const double excess = excessOf(&now->clocks[0]);
    const int64_t trueLengthNs = ns - (int64_t)((double)ns * (excess / (1 + excess)));
    const int64_t endNs = ns == kForever ? kForever : now->elapsedNs + trueLengthNs;
    if (ready && ns == 0) advance(kLookNs);
    for (;;) {
        const int found = ready ? ready(what) : 0;
        if (found != 0) return found;
        if (now->elapsedNs >= endNs) break;
        const int64_t nextNs = nextEventNs();
        if (endNs == kForever && nextNs == kForever) giveUp("waits for ever", "");
        now->signalled = 0;
        advanceTo(nextNs < endNs ? nextNs : endNs);
        if (!now->signalled) continue;
        if (leftNs) *leftNs = endNs - now->elapsedNs;
        return fail(EINTR);
    }
    if (ns > 0) advance((int64_t)now->wakeNs);
    return 0;
}

int clock_nanosleep(clockid_t id, int flags, const struct timespec* time, struct timespec* left)
{
    struct clock* const clock = clockOfId(id);
    if (!clock) return EINVAL;
    int64_t ns = nsOf(time);
    int64_t leftNs = 0;
    if (flags & TIMER_ABSTIME) ns -= readingOf(id, clock);
    if (waitFor(ns > 0 ? ns : 0, NULL, NULL, &leftNs) == 0) return 0;
    if (left && !(flags & TIMER_ABSTIME)) *left = timespecOf(leftNs);
    return EINTR;
}

int nanosleep(const struct timespec* time, struct timespec* left)
{
    const int failure = clock_nanosleep(CLOCK_MONOTONIC, 0, time, left);
    return failure ? fail(failure) : 0;
}

int usleep(useconds_t us)
{
    return nanosleep(&(struct timespec){us / 1000000, (long)(us % 1000000) * 1000}, NULL);
}

unsigned sleep(unsigned seconds)
{
    struct timespec left = {0, 0};
    return nanosleep(&(struct timespec){seconds, 0}, &left) ? (unsigned)left.tv_sec : 0;
}

struct polled {
    struct pollfd* files;
    nfds_t count;
};

static int pollNow(void* what)
{
    const struct polled* const polled = what;
    return NEXT(poll)(polled->files, polled->count, 0);
}

int poll(struct pollfd* files, nfds_t count, int ms)
{
    struct polled polled = {files, count};
    return waitFor(ms < 0 ? kForever : ms * 1000000LL, pollNow, &polled, NULL);
}

int ppoll(struct pollfd* files, nfds_t count, const struct timespec* time, const sigset_t* mask)
{
    sigset_t before;
    struct polled polled = {files, count};
    if (mask) (void)pthread_sigmask(SIG_SETMASK, mask, &before);
    const int found = waitFor(time ? nsOf(time) : kForever, pollNow, &polled, NULL);
    if (mask) (void)pthread_sigmask(SIG_SETMASK, &before, NULL);
    return found;
}

struct selected {
    int count;
    fd_set* sets[3];
    fd_set asked[3];
};

static int selectNow(void* what)
{
    struct selected* const selected = what;
    for (int i = 0; i < 3; ++i)
        if (selected->sets[i]) *selected->sets[i] = selected->asked[i];
    struct timeval none = {0, 0};
    return NEXT(select)(selected->count, selected->sets[0], selected->sets[1], selected->sets[2],
                        &none);
}

int pselect(int count, fd_set* restrict in, fd_set* restrict out, fd_set* restrict other,
            const struct timespec* restrict time, const sigset_t* restrict mask)
{
    sigset_t before;
    struct selected selected = {.count = count, .sets = {in, out, other}};
    for (int i = 0; i < 3; ++i)
        if (selected.sets[i]) selected.asked[i] = *selected.sets[i];
    if (mask) (void)pthread_sigmask(SIG_SETMASK, mask, &before);
    const int found = waitFor(time ? nsOf(time) : kForever, selectNow, &selected, NULL);
    if (mask) (void)pthread_sigmask(SIG_SETMASK, &before, NULL);
    return found;
}

int select(int count, fd_set* restrict in, fd_set* restrict out, fd_set* restrict other,
           struct timeval* restrict time)
{
    if (!time) return pselect(count, in, out, other, NULL, NULL);
    const struct timespec fine = {time->tv_sec, (long)time->tv_usec * 1000};
    return pselect(count, in, out, other, &fine, NULL);
}

struct awaited {
    int file, count;
    struct epoll_event* events;
};

static int epollNow(void* what)
{
    const struct awaited* const awaited = what;
    return NEXT(epoll_wait)(awaited->file, awaited->events, awaited->count, 0);
}

int epoll_wait(int file, struct epoll_event* events, int count, int ms)
{
    struct awaited awaited = {file, count, events};
    return waitFor(ms < 0 ? kForever : ms * 1000000LL, epollNow, &awaited, NULL);
}
