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
    int64_t setNs, referenceNs; /* of the errors; of the loop */
    double offsetNs;            /* still to be slewed away by the kernel's loop */
    double singleNs;            /* by adjtime */
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
        kernel.offsetNs = kernel.singleNs = 0;
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

/* The kernel's loop slews an offset away, and takes its share of the frequency at once. */
static void loopBy(const struct timex* request)
{
    const double nano = kernel.status & STA_NANO ? 1 : 1000;
    const double mostNs = 500e6;
    if (!(kernel.status & STA_PLL)) return;
    kernel.offsetNs = fmax(-mostNs, fmin(mostNs, (double)request->offset * nano));
    const double mostSeconds = ldexp(1, 3 + kernel.constant);
    const double seconds = (double)(machine()->elapsedNs - kernel.referenceNs) * 1e-9;
    if (!(kernel.status & STA_FREQHOLD) && kernel.referenceNs > 0) {
        kernel.frequency += lround(kernel.offsetNs * fmin(seconds, mostSeconds) /
                                   ldexp(1, 2 * (4 + kernel.constant)) * kUnitsPerPpb);
    }
    kernel.referenceNs = machine()->elapsedNs;
}

/* The kernel slews second by second; here it does so whenever a stretch of time begins. */
double slewOf(double seconds)
{
    const double most = 500e3 * seconds;
    const double single = fmax(-most, fmin(most, kernel.singleNs));
    kernel.singleNs -= single;
    const double loop = kernel.offsetNs * seconds / ldexp(1, 2 + kernel.constant);
    kernel.offsetNs -= loop;
    return (single + loop) / seconds;
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
    if (modes & ADJ_FREQUENCY)
        kernel.frequency = request->freq > widest    ? widest
                           : request->freq < -widest ? -widest
                                                     : request->freq;
    if (modes & ADJ_OFFSET) loopBy(request);
    const int steered = (modes & (ADJ_FREQUENCY | ADJ_TICK)) || (modes & ADJ_OFFSET);
    if (steered && orderFrequency(clock) != 0) return -1;
    return 0;
}

static int answerKernel(const struct clock* clock, struct timex* answer)
{
    const int nano = kernel.status & STA_NANO;
    const int64_t grownUs = (machine()->elapsedNs - kernel.setNs) / kSecondNs * 500;
    const int64_t ns = timeOf(clock);
    answer->maxerror = (long)fmin(kMostErrorUs, (double)(kernel.maxError + grownUs));
    if (answer->maxerror >= kMostErrorUs) kernel.status |= STA_UNSYNC;
    answer->offset = lround(kernel.offsetNs / (nano ? 1 : 1000));
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
    if (request->modes & ADJ_OFFSET) return fail(EOPNOTSUPP);
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
    if (clock->file >= 0) return adjustPtp(clock, request);
    const int isSingle = (request->modes & ADJ_OFFSET_SINGLESHOT) == ADJ_OFFSET_SINGLESHOT;
    if (!isSingle) return adjustKernel(clock, request) ? -1 : answerKernel(clock, request);
    const long leftUs = lround(kernel.singleNs * 1e-3);
    if ((request->modes & ADJ_OFFSET_SS_READ) != ADJ_OFFSET_SS_READ)
        kernel.singleNs = (double)request->offset * 1e3;
    const int state = answerKernel(clock, request);
    request->offset = leftUs;
    return state;
}

int adjtimex(struct timex* request) { return clock_adjtime(CLOCK_REALTIME, request); }
int ntp_adjtime(struct timex* request) { return clock_adjtime(CLOCK_REALTIME, request); }

int adjtime(const struct timeval* delta, struct timeval* before)
{
    struct timex request = {.modes = delta ? ADJ_OFFSET_SINGLESHOT : ADJ_OFFSET_SS_READ};
    if (delta) request.offset = (long)(delta->tv_sec * 1000000 + delta->tv_usec);
    if (clock_adjtime(CLOCK_REALTIME, &request) < 0) return -1;
    if (before) *before = (struct timeval){request.offset / 1000000, request.offset % 1000000};
    return 0;
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
    const int64_t ns = timeOf(clock) + errorNs;
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
            memcpy(&reply->ts[2 * i], three, sizeof three);
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

static int openClock(const char* path)
{
    for (int i = 1; i < machine()->clockCount; ++i)
        if (strcmp(path, machine()->clocks[i].name) == 0)
            return fcntl(machine()->clocks[i].file, F_DUPFD_CLOEXEC, 0);
    const int isReal = strncmp(path, "/dev/ptp", 8) == 0 || strncmp(path, "/dev/rtc", 8) == 0;
    return isReal ? fail(EACCES) : -2; /* -2: any other file */
}

#define OPEN(name, parameters, next)                                                               \
    int name parameters                                                                            \
    {                                                                                              \
        va_list arguments;                                                                         \
        va_start(arguments, flags);                                                                \
        const int makes = (flags & O_CREAT) || (flags & O_TMPFILE) == O_TMPFILE;                   \
        const mode_t mode = makes ? va_arg(arguments, mode_t) : 0;                                 \
        va_end(arguments);                                                                         \
        const int file = openClock(path);                                                          \
        return file == -2 ? next : file;                                                           \
    }
OPEN(open, (const char* path, int flags, ...), NEXT(open)(path, flags, mode))
OPEN(open64, (const char* path, int flags, ...), NEXT(open64)(path, flags, mode))
OPEN(openat, (int at, const char* path, int flags, ...), NEXT(openat)(at, path, flags, mode))
OPEN(openat64, (int at, const char* path, int flags, ...), NEXT(openat64)(at, path, flags, mode))

/* The forms of a program that is compiled with checks of its arguments. */
int __open_2(const char* path, int flags);                              /* NOLINT: its name */
int __open_2(const char* path, int flags) { return open(path, flags); } /* NOLINT: its name */
