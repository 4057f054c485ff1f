/* What programs ask of clocks beside the time, and order: the system calls that set the machine's
 * clock, as the kernel does them, and the device files of PTP clocks. */
#include "machine.h"

#include <fcntl.h>
#include <linux/ptp_clock.h>
#include <math.h>
#include <stdarg.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/time.h>
#include <sys/timex.h>
#include <unistd.h>

static const double kUnitsPerPpb = 65.536;
static const double kPpbPerTick = 1e5; /* a tick is 10 ms, told in us */

enum { kMostErrorUs = 16000000 };

/* What the kernel keeps of its clock beside its time. */
static struct {
    int status, constant;
    long tick, frequency, maxError, estimatedError;
    int64_t setNs; /* when errors were told */
} kernel = {.tick = 10000, .maxError = kMostErrorUs, .estimatedError = kMostErrorUs};
static int kernelIsOn;

static int odd(const struct clock* clock, char letter)
{
    return strchr(clock->quirks, letter) != NULL;
}

static void startKernel(void)
{
    if (kernelIsOn) return;
    kernelIsOn = 1;
    kernel.status = (int)machine()->clocks[0].status;
    if (!(kernel.status & STA_UNSYNC)) kernel.maxError = kernel.estimatedError = 0;
}

static int order(struct clock* clock, double ppb)
{
    const double limitPpb = 10e3;
    if (fabs(ppb) > limitPpb && odd(clock, 'r')) return fail(ERANGE);
    if (fabs(ppb) > limitPpb && odd(clock, 'c')) ppb = copysign(limitPpb, ppb);
    clock->orderedPpb = ppb;
    traceClock(clock, "frequency");
    return 0;
}

/* After a step the kernel knows nothing of its clock. */
static int step(struct clock* clock, int64_t ns)
{
    if (odd(clock, 'p')) return fail(EPERM);
    if (clock->file < 0) {
        kernel.status |= STA_UNSYNC;
        kernel.maxError = kernel.estimatedError = kMostErrorUs;
        kernel.setNs = machine()->elapsedNs;
    }
    clock->steppedNs += ns;
    traceClock(clock, "step");
    return 0;
}

static int stepBy(struct clock* clock, const struct timex* request)
{
    const long unit = request->modes & ADJ_NANO ? 1 : 1000;
    const int64_t fraction = (int64_t)request->time.tv_usec;
    if (fraction < 0 || fraction >= kSecondNs / unit) return fail(EINVAL);
    return step(clock, (int64_t)request->time.tv_sec * kSecondNs + fraction * unit);
}

static int orderFrequency(struct clock* clock)
{
    return order(clock, (double)kernel.frequency / kUnitsPerPpb +
                            (double)(kernel.tick - 10000) * kPpbPerTick);
}

static int adjustKernel(struct clock* clock, struct timex* request)
{
    const unsigned modes = request->modes;
    const int64_t nowNs = machine()->elapsedNs;
    const long widest = 500L << 16;
    if ((modes & ADJ_TICK) && labs(request->tick - 10000) > 1000) return fail(EINVAL);
    if ((modes & ADJ_SETOFFSET) && stepBy(clock, request) != 0) return -1;
    if (modes & ADJ_STATUS) kernel.status = request->status;
    if (modes & ADJ_NANO) kernel.status |= STA_NANO;
    if (modes & ADJ_MICRO) kernel.status &= ~STA_NANO;
    if (modes & ADJ_MAXERROR) kernel.maxError = request->maxerror;
    if (modes & ADJ_MAXERROR) kernel.setNs = nowNs;
    if (modes & ADJ_ESTERROR) kernel.estimatedError = request->esterror;
    if (modes & ADJ_TIMECONST)
        kernel.constant = (int)request->constant + (kernel.status & STA_NANO ? 0 : 4);
    if ((modes & ADJ_TAI) && request->constant >= 0) machine()->taiS = (double)request->constant;
    if (modes & ADJ_TICK) kernel.tick = request->tick;
    if (modes & ADJ_FREQUENCY) {
        kernel.frequency = request->freq > widest    ? widest
                           : request->freq < -widest ? -widest
                                                     : request->freq;
    }
    return modes & (ADJ_FREQUENCY | ADJ_TICK) ? orderFrequency(clock) : 0;
}

static int answerKernel(const struct clock* clock, struct timex* answer)
{
    const int nano = kernel.status & STA_NANO;
    const int64_t grownUs = (machine()->elapsedNs - kernel.setNs) / kSecondNs * 500;
    const int64_t ns = timeOf(clock);
    answer->maxerror = (long)fmin(kMostErrorUs, (double)(kernel.maxError + grownUs));
    if (answer->maxerror >= kMostErrorUs) kernel.status |= STA_UNSYNC;
    answer->offset = 0;
    answer->freq = odd(clock, 'c') ? lround(clock->orderedPpb * kUnitsPerPpb) : kernel.frequency;
    answer->esterror = kernel.estimatedError;
    answer->status = kernel.status;
    answer->constant = kernel.constant;
    answer->precision = 1;
    answer->tolerance = 500L << 16;
    answer->tick = kernel.tick;
    answer->tai = (int)machine()->taiS;
    answer->time.tv_sec = (time_t)(ns / kSecondNs);
    answer->time.tv_usec = (suseconds_t)(ns % kSecondNs / (nano ? 1 : 1000));
    return kernel.status & STA_UNSYNC ? TIME_ERROR : TIME_OK;
}

static int adjustPtp(struct clock* clock, struct timex* request)
{
    if (clock->silent) return fail(EIO);
    if ((request->modes & ADJ_SETOFFSET) && stepBy(clock, request) != 0) return -1;
    if (request->modes & ADJ_FREQUENCY) {
        const double ppb = (double)request->freq / kUnitsPerPpb;
        if (fabs(ppb) > clock->maxPpb) return fail(ERANGE);
        if (order(clock, ppb) != 0) return -1;
    }
    request->freq = lround(clock->orderedPpb * kUnitsPerPpb);
    request->tolerance = lround(fmin(clock->maxPpb * kUnitsPerPpb, INT32_MAX));
    return 0;
}

int clock_adjtime(clockid_t id, struct timex* request)
{
    struct clock* const clock = id == CLOCK_REALTIME || id < 0 ? clockOfId(id) : NULL;
    if (!clock) return fail(EINVAL);
    startKernel();
    advance((int64_t)machine()->readingNs);
    if (request->modes && odd(clock, 'p')) return fail(EPERM);
    if ((request->modes & ADJ_OFFSET_SINGLESHOT) && request->offset != 0) return fail(EOPNOTSUPP);
    if (clock->file >= 0) return adjustPtp(clock, request);
    return adjustKernel(clock, request) ? -1 : answerKernel(clock, request);
}

int adjtimex(struct timex* request) { return clock_adjtime(CLOCK_REALTIME, request); }
int ntp_adjtime(struct timex* request) { return clock_adjtime(CLOCK_REALTIME, request); }

/* The kernel's own slewing of an offset is left out. */
int adjtime(const struct timeval* delta, struct timeval* before)
{
    (void)delta;
    (void)before;
    return fail(EOPNOTSUPP);
}

int clock_settime(clockid_t id, const struct timespec* time)
{
    struct clock* const clock = id == CLOCK_REALTIME || id < 0 ? clockOfId(id) : NULL;
    if (!clock) return fail(EINVAL);
    return step(clock, (int64_t)time->tv_sec * kSecondNs + time->tv_nsec - timeOf(clock));
}

int settimeofday(const struct timeval* time, const struct timezone* zone)
{
    (void)zone;
    if (!time) return fail(EPERM);
    const struct timespec fine = {time->tv_sec, (long)time->tv_usec * 1000};
    return clock_settime(CLOCK_REALTIME, &fine);
}

int stime(const time_t* time);
int stime(const time_t* time)
{
    return clock_settime(CLOCK_REALTIME, &(struct timespec){*time, 0});
}

static struct ptp_clock_time timeFor(const struct clock* clock, int64_t errorNs)
{
    const int64_t ns = cutStamp(&clock->reading, timeOf(clock) + errorNs);
    return (struct ptp_clock_time){ns / kSecondNs, (uint32_t)(ns % kSecondNs), 0};
}

/* The machine's clock before and after a reading of the device, and the device half way between. */
static void crossRead(struct clock* clock, struct ptp_clock_time* three)
{
    const int64_t halfNs = (int64_t)clock->delayNs / 2;
    const struct clock* const system = &machine()->clocks[0];
    three[0] = timeFor(system, 0);
    advance(halfNs);
    three[1] = timeFor(clock, measurementErrorNs(&clock->reading));
    advance((int64_t)clock->delayNs - halfNs);
    three[2] = timeFor(system, 0);
}

static int answerPtp(struct clock* clock, unsigned long request, void* argument)
{
    const unsigned number = _IOC_NR(request);
    struct ptp_clock_time three[3];
    if (clock->silent) return fail(EIO);
    if (number == _IOC_NR(PTP_CLOCK_GETCAPS) || number == _IOC_NR(PTP_CLOCK_GETCAPS2)) {
        memset(argument, 0, sizeof(struct ptp_clock_caps));
        ((struct ptp_clock_caps*)argument)->max_adj = (int)clock->maxPpb;
        return 0;
    }
    if (isMissing(&clock->reading)) return fail(EIO);
    if (odd(clock, 'b') && number != _IOC_NR(PTP_SYS_OFFSET) && number != _IOC_NR(PTP_SYS_OFFSET2))
        return fail(EOPNOTSUPP);
    if (number == _IOC_NR(PTP_SYS_OFFSET_PRECISE) || number == _IOC_NR(PTP_SYS_OFFSET_PRECISE2)) {
        struct ptp_sys_offset_precise* const reply = argument;
        if (odd(clock, 'e')) return fail(EOPNOTSUPP);
        advance((int64_t)clock->delayNs);
        reply->sys_realtime = timeFor(&machine()->clocks[0], 0);
        reply->device = timeFor(clock, measurementErrorNs(&clock->reading));
        return 0;
    }
    if (number == _IOC_NR(PTP_SYS_OFFSET_EXTENDED) || number == _IOC_NR(PTP_SYS_OFFSET_EXTENDED2)) {
        struct ptp_sys_offset_extended* const reply = argument;
        if (reply->n_samples > PTP_MAX_SAMPLES) return fail(EINVAL);
        for (unsigned i = 0; i < reply->n_samples; ++i)
            crossRead(clock, reply->ts[i]);
        return 0;
    }
    if (number == _IOC_NR(PTP_SYS_OFFSET) || number == _IOC_NR(PTP_SYS_OFFSET2)) {
        struct ptp_sys_offset* const reply = argument;
        if (reply->n_samples > PTP_MAX_SAMPLES) return fail(EINVAL);
        for (unsigned i = 0; i < reply->n_samples; ++i) {
            crossRead(clock, three);
            memcpy(&reply->ts[(size_t)i * 2], three, sizeof three);
        }
        return 0;
    }
    return fail(EOPNOTSUPP);
}

int ioctl(int file, unsigned long request, ...)
{
    va_list arguments;
    va_start(arguments, request);
    void* const argument = va_arg(arguments, void*);
    va_end(arguments);
    if (_IOC_TYPE(request) != PTP_CLK_MAGIC) return NEXT(ioctl)(file, request, argument);
    struct clock* const clock = clockOfFile(file);
    return clock ? answerPtp(clock, request, argument) : fail(ENOTTY);
}

/* A descriptor of a simulated clock is one of its stand-in file. */
struct clock* clockOfFile(int file)
{
    struct stat found;
    struct stat own;
    if (fstat(file, &found) != 0) return NULL;
    for (int i = 1; i < machine()->clockCount; ++i) {
        struct clock* const clock = &machine()->clocks[i];
        if (fstat(clock->file, &own) == 0 && own.st_ino == found.st_ino &&
            own.st_dev == found.st_dev)
            return clock;
    }
    return NULL;
}

/* NULL: some other file. A clock of the real machine has no stand-in. */
static const struct clock* clockOfPath(const char* path)
{
    static const struct clock real = {.file = -1};
    for (int i = 1; i < machine()->clockCount; ++i) {
        if (strcmp(path, machine()->clocks[i].name) == 0) return &machine()->clocks[i];
    }
    return strncmp(path, "/dev/ptp", 8) == 0 || strncmp(path, "/dev/rtc", 8) == 0 ? &real : NULL;
}

static int openClock(const struct clock* clock)
{
    return clock->file < 0 ? fail(EACCES) : fcntl(clock->file, F_DUPFD_CLOEXEC, 0);
}

/* The mode is there only for files that are made; passed on it does no harm. */
#define OPEN(name)                                                                                 \
    int name(const char* path, int flags, ...)                                                     \
    {                                                                                              \
        va_list arguments;                                                                         \
        va_start(arguments, flags);                                                                \
        const mode_t mode = va_arg(arguments, mode_t);                                             \
        va_end(arguments);                                                                         \
        const struct clock* const clock = clockOfPath(path);                                       \
        return clock ? openClock(clock) : NEXT(name)(path, flags, mode);                           \
    }
#define OPEN_AT(name)                                                                              \
    int name(int at, const char* path, int flags, ...)                                             \
    {                                                                                              \
        va_list arguments;                                                                         \
        va_start(arguments, flags);                                                                \
        const mode_t mode = va_arg(arguments, mode_t);                                             \
        va_end(arguments);                                                                         \
        const struct clock* const clock = clockOfPath(path);                                       \
        return clock ? openClock(clock) : NEXT(name)(at, path, flags, mode);                       \
    }
OPEN(open)
OPEN(open64)
OPEN_AT(openat)
OPEN_AT(openat64)

/* The forms of a program that is compiled with checks of its arguments. */
int __open_2(const char* path, int flags);                              /* NOLINT: its name */
int __open_2(const char* path, int flags) { return open(path, flags); } /* NOLINT: its name */
