/* The clock servo plug-in as a host sees it: one table of clock operations and nine functions.
 *
 * A host loads libdravik.so.1 with dlopen, binds the nine functions under their plain names, and
 * for each clock fills a zvckmservo_HostTable (words 13 to 18), calls zvckmservo_initialize, then
 * the other functions as often as it likes, and at last zvckmservo_finalize.
 *
 * The plug-in starts no thread and no timer. It acts only inside these calls, on the caller's
 * thread, and while it is being loaded, when it settles where its default documents lie. Of the
 * calls, zvckmservo_applyMetaData alone reads a file. No exception leaves any of them. Needs C11 or
 * C++11.
 *
 * Signs: the clock is ahead when its time is greater than the reference's; a positive frequency
 * offset makes the clock run faster; a positive step moves it forward. */
#ifndef ZVCKMSERVO_SERVO_H
#define ZVCKMSERVO_SERVO_H

#include "zverr/status.h"

#ifdef __cplusplus
#define ZVCKMSERVO_NOTHROW noexcept
extern "C" {
#else
#define ZVCKMSERVO_NOTHROW
#endif

#define ZVCKMSERVO_API __attribute__((visibility("default")))

/* One clock of the host. The host owns the record; the plug-in keeps the pointer, makes no copy,
 * and never moves or frees it. It must stay where it is, with all six operations callable, from
 * the start of zvckmservo_initialize to the return of zvckmservo_finalize.
 *
 * The operations take no context argument: a host with several clocks keeps the one in question
 * per thread while it is inside a call of the plug-in.
 *
 * Every operation is called on the thread of the call that led to it. Its status is a fresh, empty
 * one of the plug-in's, never the one given to the exported function:
 *   - a negative code reports failure and arrives, payload included, in the status of the exported
 *     function; a zero or positive code is success, and is dropped with its payload;
 *   - a payload is written through the status's own reallocJson and released by the plug-in.
 * What an operation wrote through its pointer counts only if it succeeded.
 *
 * Words 13 to 16 are called with the servo's lock held and may call the plug-in again on the same
 * thread, but for zvckmservo_finalize. The pair that led there then goes on where it was: what a
 * zvckmservo_clearHistory inside it cleared, the rest of that pair may set again. Words 17 and 18
 * are called while there is no servo yet and may not call the plug-in.
 * An operation must return or throw; a thread that ends itself inside one (pthread_exit) ends the
 * process. */
typedef struct zvckmservo_HostTable {
    /* word 0: the servo; opaque to the host. Written by zvckmservo_initialize, set to null by
     * zvckmservo_finalize. Null before the first initialisation, so that finalize is harmless. */
    void* servoHandle;

    /* words 1 to 12: the host's own; neither read nor written by the plug-in. */
    void* hostWords[12];

    /* word 13: store the clock's present time, unsigned nanoseconds, in *timeNs, which the plug-in
     * has set to 0. Asked for by zvckmservo_getTime only. */
    void (*getTime)(uint64_t* timeNs, zverr_Status* status);

    /* word 14: move the clock by deltaNs, signed nanoseconds, positive forward; a difference, never
     * an absolute time. On success the clock has moved by exactly that; it is not read back.
     * Called at most once for each pair. */
    void (*stepTime)(int64_t deltaNs, zverr_Status* status);

    /* word 15: store the offset of the clock's rate from nominal that is really in force, signed
     * parts per billion, in *offsetPpb, which the plug-in has set to 0. Each correction starts
     * from this value. */
    void (*getFrequency)(int32_t* offsetPpb, zverr_Status* status);

    /* word 16: set the offset of the clock's rate from nominal, signed parts per billion. Within
     * the limits below, except that a measurement which is not a number goes out as 0; if the
     * limits cross, a value beyond one of them goes out as that one. */
    void (*setFrequency)(int32_t offsetPpb, zverr_Status* status);

    /* words 17 and 18: the highest and the lowest offset that setFrequency may be given, signed
     * parts per billion (the lowest is negative if the clock can be slowed). Each is called once,
     * during zvckmservo_initialize, the maximum first. They are not compared with each other. */
    int32_t (*getMaxFrequencyOffset)(zverr_Status* status);
    int32_t (*getMinFrequencyOffset)(zverr_Status* status);
} zvckmservo_HostTable;

#define ZVCKMSERVO_WORD(member, n)                                                                 \
    static_assert(offsetof(zvckmservo_HostTable, member) == (n) * sizeof(void*), "word " #n)
ZVCKMSERVO_WORD(servoHandle, 0);
ZVCKMSERVO_WORD(hostWords, 1);
ZVCKMSERVO_WORD(getTime, 13);
ZVCKMSERVO_WORD(stepTime, 14);
ZVCKMSERVO_WORD(getFrequency, 15);
ZVCKMSERVO_WORD(setFrequency, 16);
ZVCKMSERVO_WORD(getMaxFrequencyOffset, 17);
ZVCKMSERVO_WORD(getMinFrequencyOffset, 18);
#undef ZVCKMSERVO_WORD
static_assert(sizeof(zvckmservo_HostTable) == 19 * sizeof(void*), "nineteen words");

/* Common to all functions below:
 *   host    the table of the clock; not null; its servoHandle valid, so only between a successful
 *           zvckmservo_initialize and zvckmservo_finalize, which excepts these two and isSeeded
 *   status  in/out, owned by the caller, not null, all four fields set. A negative code on entry
 *           makes the call do nothing at all; a positive one stops nothing and is still there
 *           after a call that went well. A failure of a call is in it afterwards:
 *             the code and payload of a failed host operation;
 *             zvplaterr_memoryFull for a std::bad_alloc, the plug-in's or a host operation's;
 *             zvplaterr_softwareFaultPLATInternalUseOnly for whatever else was thrown;
 *           and what is named at the function. To use the record again, set its code to 0; the
 *           buffer may stay.
 *           A call made while an exception is propagating on the thread (from a destructor) does
 *           not report the failure of a host operation: make none there.
 * Threads:  any, also at the same time: one lock per servo serialises the calls on a table, and is
 *           held across its host operations. Servos of different tables share nothing. No call may
 *           overlap zvckmservo_initialize or zvckmservo_finalize of the same table.
 *           A thread may be cancelled inside a call, if its cancelability type is the deferred one:
 *           the request takes effect behind the call, also where a host operation has a
 *           cancellation point. */

/* Makes a servo for the clock, with default parameters, ready for the first pair. Calls
 * getMaxFrequencyOffset and getMinFrequencyOffset; the clock is not touched.
 * servoHandle is written last: after a failure it is what it was and no servo exists. A handle that
 * is already there is overwritten, and its servo lost. */
ZVCKMSERVO_API void zvckmservo_initialize(zvckmservo_HostTable* host, zverr_Status* status);

/* Sets servoHandle to null and ends the servo that was in it, if any; calling it twice is harmless.
 * No host operation is called: the clock keeps its frequency. Cannot fail. */
ZVCKMSERVO_API void zvckmservo_finalize(zvckmservo_HostTable* host) ZVCKMSERVO_NOTHROW;

/* Returns 0, always: this servo never reports itself as seeded. Reads nothing, not even the table,
 * and may be called at any time. */
ZVCKMSERVO_API int32_t zvckmservo_isSeeded(zvckmservo_HostTable* host);

/* Starts the discipline of the clock over: the next pair is the first of a new measurement of its
 * frequency. Parameters, clock and the clock's frequency are left alone. */
ZVCKMSERVO_API void zvckmservo_clearHistory(zvckmservo_HostTable* host, zverr_Status* status);

/* Delivers one measurement.
 *   referenceTime, clockTime  the time of the reference and of the clock at one moment, unsigned
 *                             nanoseconds on one timescale, less than 2^63 ns apart from each other
 *                             and from the pairs before (beyond that, differences wrap)
 * The first two pairs measure and correct the clock's rate, the third steps the clock if it is at
 * least the snap threshold (1 us by default) off, and from the fourth on each pair corrects the
 * frequency; an error that reaches the threshold starts over. If the two pairs ask for a frequency
 * beyond the host's limits, the clock gets the limit and the measurement starts over with the next
 * pair, as often as it takes: a clock that no allowed frequency puts right is never stepped. So a
 * pair may call getFrequency and then setFrequency, or stepTime, or none of them.
 * The control law counts pairs, not seconds. With the default parameters it is stable for less
 * than 80/33 s (2.4 s) of reference time from pair to pair; 0.1 s to 1 s is customary.
 * After the failure of a host operation nothing is rolled back; the servo goes on with the next
 * pair. */
ZVCKMSERVO_API void zvckmservo_adjustTime(zvckmservo_HostTable* host, uint64_t referenceTime,
                                          uint64_t clockTime, zverr_Status* status);

/* Reads the disciplined clock through the host's getTime.
 *   time  out: unsigned nanoseconds; not null; written on success only */
ZVCKMSERVO_API void zvckmservo_getTime(zvckmservo_HostTable* host, uint64_t* time,
                                       zverr_Status* status);

/* Sets parameters from a configuration document: one JSON object of numbers, any of
 *
 *     key                       bounds, inclusive    default  what it is
 *     "frequencyLockGain"       1e-9 to 10           1        factor on the measured rate
 *     "phaseLockGain"           1e-9 to 10           0.55     the control law:
 *     "phaseLockCoefficientA"   -10 to 10            2          weight of this pair's error
 *     "phaseLockCoefficientB"   -10 to 10            1          weight of the last pair's error
 *     "phaseLockCoefficientC"   -10 to 10            1          weight of the frequency in force
 *     "snapTimeThreshold"       1e-8 to 10           1e-6     seconds; an error as large is stepped
 *     "spikeFilterEnabled"      1, or anything else  0        1 turns the filter on
 *     "spikeFilterHistorySize"  2 to 100             5        pairs that it looks back
 *     "spikeFilterMaxThreshold" 1e-9 to 10           1        seconds per second: its limit's
 *     "spikeFilterMinThreshold" 1e-9 to 10           2.5e-8   highest and lowest value
 *     "spikeFilterGrowthFactor" 1.001 to 100         3        limit over the mean of the past
 *
 * zvckmservo/parameters.h has the same table for programs. Leave "frequencyLockGain" at 1: it is a
 * factor on the whole rate, not on its distance from nominal, so with 0.5 the clock is sent to its
 * lowest limit and never leaves the measurement. The first rate that the filter sees in a servo's
 * first lock is held to 1 s/s, whatever its highest value.
 *
 * Values are applied in this order, whatever their order in the text; a key that is missing leaves
 * its parameter alone, and other members are ignored. Keys are found without regard to case (as the
 * process's LC_CTYPE folds it), the first match counts, and so does a key up to an escaped zero.
 * Flag and size are cut toward zero first. Text behind the object is ignored, and a text that is
 * JSON but no object sets nothing. The decimal separator is a point in every locale; in one whose
 * own separator takes several bytes, a text with a point in a number counts as not JSON.
 *   configJson  the document, zero-terminated; borrowed for the call. Null fails with
 *               zvplaterr_softwareFaultPLATInternalUseOnly
 * Returns: 0 on success, 1 on failure or if the status was negative on entry.
 * Errors:  zvplaterr_invalidParameter for text that is not JSON (or nested deeper than 1000 levels,
 *          or no memory to parse it), and then nothing is set; for a value that is no number or out
 *          of its bounds, and then what stands above it in the order is set and the rest is not.
 *          A value out of its bounds is not named in the payload: "file" is "dravik/tServo", and
 *          "line" is the number of its key in zvckmservo/parameters.h. */
ZVCKMSERVO_API int zvckmservo_writeServoConfigJson(zvckmservo_HostTable* host,
                                                   const char* configJson, zverr_Status* status);

/* Gives the parameters in force as a configuration document: all eleven keys in the order above, a
 * line each, numbers with a decimal point whatever the locale, long enough to read back as the very
 * same double (not in a locale whose separator takes several bytes, see above). Less than 1024
 * characters.
 *   buffer      out: the first bufferSize characters of the document, without a terminating zero:
 *               give a zeroed one, larger than the text; null only if bufferSize is 0; untouched on
 *               failure
 *   bufferSize  bytes in buffer; a longer document is cut without an error
 * Returns: 0 on success, 1 on failure or if the status was negative on entry.
 * Errors:  zvplaterr_memoryFull, or zvplaterr_softwareFaultPLATInternalUseOnly for no memory to
 *          print it. */
ZVCKMSERVO_API int zvckmservo_readServoConfigJson(zvckmservo_HostTable* host, char* buffer,
                                                  size_t bufferSize, zverr_Status* status);

/* Takes metadata of the selected time reference and, if its type is another than the one told last,
 * applies the default document of that type, if there is one:
 *
 *     {"selectedTRInstID": "a", "TRs": {"a": {"type": "IEEE 1588-2008 BC"}}}
 *
 * Keys, the identifier ("a" here) included, are found without regard to case; types are compared
 * exactly. A member that is missing means no type, and so does a "type" of null. An identifier of
 * null counts as the empty text, which finds a member of "TRs" with an empty key. Without an
 * identifier "TRs" is not looked at.
 * Documents are there for "IEEE 802.1AS-2011 TAB" and "IEEE 1588-2008 BC", in files whose places
 * are settled when the library is loaded. A line in the system log (LOG_INFO) says that a file is
 * read, or that it cannot be opened, which is no failure. A type counts as told even if its file
 * fails, and is then not tried again.
 *   metaDataJson  the metadata, zero-terminated; borrowed for the call; null does nothing
 * Errors:  jsonErrorsInvalidJSON for text that is not JSON; jsonErrorsNotAnObject for a "TRs", or
 *          a member of it that is asked for, of another type, null included;
 *          jsonErrorsTypeMismatch (the same code) for an identifier or a "type" that is neither
 *          text nor null. They leave the type told last as it was. A document in a file fails as in
 *          zvckmservo_writeServoConfigJson. */
ZVCKMSERVO_API void zvckmservo_applyMetaData(zvckmservo_HostTable* host, const char* metaDataJson,
                                             zverr_Status* status);

#ifdef __cplusplus
}
#endif

#endif
