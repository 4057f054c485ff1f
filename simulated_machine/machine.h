#pragma once
// clang-format off
/* A simulated machine for unchanged programs: loaded before the C library it keeps all their clocks
 * and lets time pass only while they wait, so that an hour takes no time and gives the same bytes
 * again. Nothing under it can set a clock of the real machine. Not for programs of several threads.
 *
 * SIMULATED_MACHINE names a file of statements, one a line; # begins a comment. Beside it a file
 * with .loaded at the end of its name shows that the library was loaded indeed. Times have a unit
 * of ns, us, ms, s, min, h, frequencies one of ppb, ppm, shares may have %.
 *   seed N                 of all noise
 *   start T                true time at the start
 *   tai N                  seconds between TAI and UTC
 *   grid T                 how often oscillators change (10ms), whatever the program does
 *   reading T              what each reading of a clock takes (20ns)
 *   wake T                 lateness of a waker
 *   trace FILE [pace=T]    rows of elapsed_s,clock,error_ns,ordered_ppb,event: the true error of
 *                          each clock at each order given to it, and at a pace
 *   emulator               run by an emulator: a filter of system calls cannot be had
 *
 *   system KEY=VALUE...    the machine's oscillator, which all CLOCK_... share
 *   ptp PATH KEY=VALUE...  a PTP hardware clock that is opened by that name
 *     offset= frequency=   at the start, against true time
 *     max=                 the largest order
 *     white= wander=       noise of the frequency: deviation over 1 s, of its walk in 1 s
 *     flicker=             as Allan deviation, the same over all times
 *     sine= period= ramp=  ppb to either side, upwards first; time; ppb each second
 *     file=FILE            ppb, a line for each second
 *     status=              system: bits of the kernel's clock at the start (64: not synchronised)
 *     delay=               ptp: of a reading
 *     quirks=LETTERS       p: no permission to set; orders beyond 10 ppm are c: cut, r: refused;
 *                          e: no PTP_SYS_OFFSET_PRECISE; b: nor _EXTENDED
 *
 *   shm UNIT KEY=VALUE...  a segment of NTP with a producer in it
 *   sock PATH KEY=VALUE... a producer of datagrams to that socket of the program
 *     interval= first=     when samples come; none without an interval
 *     count=               how many of them
 *     offset=              true time as they have it
 *     bits=32|64           of a time_t
 *     mode=0|1             of a segment; absent=1 leaves making it to the program
 *     micro=1              nanoseconds are left at 0
 *     leap=N               leap indicator
 *     pulse=1              only the fraction of a second of an offset holds, the rest is wrong
 *     spoilt=WORD/...      the first samples, one word each: leap old magic short long torn ok
 *
 * Clocks of PTP, segments and sockets also take what their readings have of errors:
 *     noise=               deviation
 *     outliers= delayed=   share of outliers of both signs, and of those that are late
 *     size=                of both
 *     errors=FILE          ns, a line each
 *     granularity=         of their stamps
 *     missing=             share that does not come; readings of a PTP clock fail
 *     delay= flicker=      mean of an exponential delay, which shows the reader ahead; TDEV, the same
 *                          over all times; of a PTP clock these two come from a scenario only
 *
 *   scenario FILE CLOCK SOURCE
 *                          a file as dravik-host simulate takes it, for one clock (system or a PATH)
 *                          and one source (UNIT or PATH) of those above it: values at the start, and
 *                          what happens later. interval= is for segments and sockets. It has not the
 *                          same random numbers there and here, but the same statistics; here they
 *                          are the same for every kind of source. After a jump errors in traces
 *                          count against where the source is.
 *
 *   at T signal HUP|INT|TERM
 *   at T run SHELL COMMAND
 *   at T step NAME T       by somebody else; NAME is system, a PATH or a UNIT
 *   at T frequency NAME F
 *   at T silence NAME      no samples; readings of a PTP clock fail
 *   at T resume NAME */
// clang-format on
#define _GNU_SOURCE
#include <dlfcn.h>
#include <errno.h>
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/types.h>
#include <time.h>

enum { kSecondNs = 1000000000 };

/* Random numbers that are the same bits on every machine; each cause has its own. */
struct noise {
    uint64_t state;
    double spare;
    int hasSpare;
};
double uniform(struct noise* noise);     /* 0 to below 1 */
double normal(struct noise* noise);      /* mean 0, deviation 1 */
double exponential(struct noise* noise); /* mean 1 */
double sineOfTurns(double turns);

/* Walks that are drawn back to 0, each four times as slowly as the one before. */
enum { kStages = 12 };
struct flicker {
    struct noise noise;
    double stages[kStages];
};
double flickerOfAllan(struct flicker* flicker, double ppb); /* of frequencies: the deviation */
double flickerOfTime(struct flicker* flicker, double ns);   /* of times: TDEV */

struct series {
    double* values;
    size_t count;
};

struct measurement {
    double deviationNs, outlierShare, delayedShare, outlierNs, delayNs, flickerNs, granularityNs,
        missingShare;
    struct series errorsNs;
    size_t next;
    struct noise noise, chances, delays, misses;
    struct flicker flicker;
};
int64_t measurementErrorNs(struct measurement* model);
int64_t cutStamp(const struct measurement* model, int64_t ns); /* to the granularity */
int isMissing(struct measurement* model);

struct phase {
    int64_t wholeNs;
    double fractionNs;
};

struct clock {
    char name[108];
    struct phase raw, steered; /* since the start; a step moves neither */
    int64_t steppedNs;         /* with the offset at the start */
    double offsetNs, frequencyPpb, whitePpb, wanderPpb, sinePpb, periodNs, rampPpb, maxPpb,
        flickerPpb;
    struct series filePpb;
    double delayNs, status;
    char quirks[8];
    struct measurement reading;
    struct noise white, walk;
    struct flicker flicker;
    double walkedPpb, rampedPpb, turns; /* turns: of the sinusoid */
    double ownPpb;                      /* of the oscillator, in this stretch of the grid */
    double orderedPpb;
    int silent, file;
};

struct producer {
    char path[108]; /* "": a segment */
    double unit, intervalNs, firstNs, count, offsetNs, bits, mode, absent, micro, pulse, leap;
    char spoilt[64];
    struct measurement reading;
    int64_t nextNs, steppedNs;
    int silent, produced, file;
    size_t size;
    unsigned char* segment;
};

enum verb { kSignal, kRun, kStep, kFrequency, kSilence, kResume, kJump, kClock, kReference };
struct event {
    int64_t atNs;
    enum verb verb;
    char text[256];
    double value;
};

enum { kClocks = 4, kProducers = 4, kEvents = 64 };
struct scenario {
    struct clock* clock; /* NULL: there is no scenario */
    char source[108];    /* its name; one of the next two is NULL */
    struct clock* device;
    struct producer* producer;
    int64_t lastNs; /* of its events */
};
struct machine {
    double seed, startNs, taiS, gridNs, readingNs, wakeNs, paceNs;
    int emulated, signalled;
    FILE* trace;
    int64_t elapsedNs, slotEndNs, nextTraceNs; /* true time since the start */
    struct clock clocks[kClocks];              /* the first is the machine's */
    struct producer producers[kProducers];
    struct scenario scenario;
    int64_t jumpedNs;             /* of its reference */
    struct event events[kEvents]; /* one that is over has the verb kept and atNs at INT64_MAX */
    int clockCount, producerCount, eventCount;
};

struct machine* machine(void); /* configured on first use */
_Noreturn void giveUp(const char* what, const char* which);
void configure(struct machine* made);
void readStatements(struct machine* made, const char* path,
                    void take(struct machine* made, char* statement));
double quantityIn(const char* text);
int setClock(struct clock* clock, const char* name, const char* value); /* 0: no such name */
int setReading(struct measurement* reading, const char* name, const char* value);

void addScenario(struct machine* made, const char* path, char** rest);
void playScenario(struct machine* made, struct event* event); /* kClock, kReference */
void lockUp(int emulated); /* no clock of the real machine can be set from here on */

int64_t trueNs(void);
int64_t timeOf(const struct clock* clock);
double excessOf(const struct clock* clock); /* of its rate, as a fraction */
void advance(int64_t ns);
void advanceTo(int64_t elapsedNs);
int64_t nextEventNs(void);
void traceClock(const struct clock* clock, const char* event);
struct clock* clockOfFile(int file);
struct clock* clockOfId(clockid_t id); /* NULL: of the processor, or not there */

void startProducer(struct producer* producer);
void produce(struct producer* producer);

/* The C library's own function of that name. */
#define NEXT(name) (__extension__(__typeof__(&(name))) nextFunction(#name))
void* nextFunction(const char* name);

static inline int fail(int failure)
{
    errno = failure;
    return -1;
}
