/* Loaded before the C library, it keeps CLOCK_REALTIME and a PTP hardware clock itself, so that
 * programs steer those and never the machine's: oscillators 100 ppm and -150 ppm off, starting at
 * 1000000000 s and 2000000000 s. KERNEL_CLOCKS names what is out of the ordinary, in letters:
 *   p  no capability to set anything     c  frequencies beyond 10 ppm become 10 ppm
 *   r  frequencies beyond 10 ppm are refused
 *   e  no PTP_SYS_OFFSET_PRECISE         b  nor _EXTENDED */
#define _GNU_SOURCE
#include <dlfcn.h>
#include <errno.h>
#include <linux/ptp_clock.h>
#include <math.h>
#include <stdarg.h>
#include <stdint.h>
#include <stdlib.h>
#include <string.h>
#include <sys/ioctl.h>
#include <sys/timex.h>
#include <time.h>

struct clock {
    int64_t wholeNs;
    double rate;
    long frequency;
    int64_t rawNs;
};
static struct clock realtime = {1000000000LL * 1000000000, 100e-6, 0, 0};
static struct clock ptp = {2000000000LL * 1000000000, -150e-6, 0, 0};

static int odd(char letter)
{
    const char* const letters = getenv("KERNEL_CLOCKS");
    return letters && strchr(letters, letter);
}

static int64_t nsOfMachine(clockid_t id)
{
    static int (*gettime)(clockid_t, struct timespec*);
    struct timespec time;
    if (!gettime) *(void**)&gettime = dlsym(RTLD_NEXT, "clock_gettime");
    gettime(id, &time);
    return (int64_t)time.tv_sec * 1000000000 + time.tv_nsec;
}

static int64_t nsOf(struct clock* clock)
{
    const int64_t rawNs = nsOfMachine(CLOCK_MONOTONIC_RAW);
    const int64_t passedNs = clock->rawNs ? rawNs - clock->rawNs : 0;
    const double excess = clock->rate + (double)clock->frequency / 65536e6;
    clock->wholeNs += passedNs + llround((double)passedNs * excess);
    clock->rawNs = rawNs;
    return clock->wholeNs;
}

int clock_gettime(clockid_t id, struct timespec* time)
{
    const int64_t ns = id == CLOCK_REALTIME ? nsOf(&realtime)
                       : id < 0             ? nsOf(&ptp)
                                            : nsOfMachine(id);
    time->tv_sec = (time_t)(ns / 1000000000);
    time->tv_nsec = (long)(ns % 1000000000);
    return 0;
}

static int fail(int failure)
{
    errno = failure;
    return -1;
}

int clock_adjtime(clockid_t id, struct timex* request)
{
    const long limit = 10L * 65536;
    struct clock* const clock = id == CLOCK_REALTIME ? &realtime : &ptp;
    nsOf(clock);
    if (request->modes && odd('p')) return fail(EPERM);
    if (request->modes & ADJ_FREQUENCY) {
        const int beyond = labs(request->freq) > limit;
        if (beyond && odd('r')) return fail(ERANGE);
        clock->frequency = !beyond || !odd('c') ? request->freq
                           : request->freq > 0  ? limit
                                                : -limit;
    }
    if (request->modes & ADJ_SETOFFSET) {
        const int64_t fraction = request->time.tv_usec;
        if (!(request->modes & ADJ_NANO) || fraction < 0 || fraction >= 1000000000)
            return fail(EINVAL);
        clock->wholeNs += (int64_t)request->time.tv_sec * 1000000000 + fraction;
    }
    memset(request, 0, sizeof *request);
    request->freq = clock->frequency;
    request->tolerance = 500L * 65536;
    request->tai = 37;
    return 0;
}

static struct ptp_clock_time timeOf(struct clock* clock)
{
    const int64_t ns = nsOf(clock);
    const struct ptp_clock_time time = {ns / 1000000000, (uint32_t)(ns % 1000000000), 0};
    return time;
}

static int answer(unsigned long request, void* argument)
{
    if (request == PTP_CLOCK_GETCAPS) {
        ((struct ptp_clock_caps*)argument)->max_adj = 62500000;
        return 0;
    }
    if (request == PTP_SYS_OFFSET_PRECISE && !odd('e') && !odd('b')) {
        struct ptp_sys_offset_precise* const reply = argument;
        reply->sys_realtime = timeOf(&realtime);
        reply->device = timeOf(&ptp);
        return 0;
    }
    if (request == PTP_SYS_OFFSET_EXTENDED && !odd('b')) {
        struct ptp_sys_offset_extended* const reply = argument;
        for (unsigned i = 0; i < 3 * reply->n_samples; ++i)
            reply->ts[i / 3][i % 3] = timeOf(i % 3 == 1 ? &ptp : &realtime);
        return 0;
    }
    if (request == PTP_SYS_OFFSET) {
        struct ptp_sys_offset* const reply = argument;
        for (unsigned i = 0; i < 2 * reply->n_samples + 1; ++i)
            reply->ts[i] = timeOf(i % 2 ? &ptp : &realtime);
        return 0;
    }
    return fail(EOPNOTSUPP);
}

int ioctl(int fd, unsigned long request, ...)
{
    va_list arguments;
    va_start(arguments, request);
    void* const argument = va_arg(arguments, void*);
    va_end(arguments);
    if (_IOC_TYPE(request) == PTP_CLK_MAGIC) return answer(request, argument);
    int (*next)(int, unsigned long, ...) = NULL;
    *(void**)&next = dlsym(RTLD_NEXT, "ioctl");
    return next(fd, request, argument);
}
