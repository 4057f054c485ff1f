/* The status record: the one form in which a failure or a warning crosses the boundary between
 * a host and the plug-in. Plain C; the layout is binding on both sides. */
#ifndef ZVERR_STATUS_H
#define ZVERR_STATUS_H

#include <assert.h>
#include <stdbool.h>
#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef struct zverr_Status zverr_Status;

/* Grows or releases the payload buffer of a status.
 *   status  the record whose buffer it is; not null; only `capacity` and `json` may change
 *   size    0: release the buffer, if there is one, and leave `json` null and `capacity` 0.
 *           Otherwise: see to a buffer of at least this many bytes. A buffer is never made
 *           smaller; its text is kept; a first buffer starts with the text "{}".
 * Returns: true if the buffer is now as asked; false leaves the record unchanged. The buffer must
 *          have the form told at `json` below.
 * Errors:  none but the result. It should not throw: what it throws is dropped, and the text is
 *          then what was written before.
 * Threads: that of the call in which the record takes part. */
typedef bool (*zverr_ReallocJsonFn)(zverr_Status* status, uint32_t size);

/* A code and its details. The maker of a record owns it and its buffer: it sets all four fields
 * before the first use, and at the end calls reallocJson(status, 0) if `json` is not null.
 * A record belongs to one thread at a time.
 *
 * The first failure wins, a failure replaces a warning (whose payload is wiped), and the plug-in
 * never clears a code. A function given a record with a negative code does nothing. */
struct zverr_Status {
    /* 0: nothing to report; negative: a failure, one of the codes below or one of the host's own;
     * positive: a warning. The plug-in raises no warning of its own. */
    int32_t code;

    /* Size of the buffer in bytes, terminator and end mark included; 0 while `json` is null. */
    uint32_t capacity;

    /* Never null: called without a test. A record that the plug-in hands to a host operation
     * brings one of the plug-in's own; it works on that record only while the library is loaded. */
    zverr_ReallocJsonFn reallocJson;

    /* While `code` is 0 it means nothing, whatever it holds: the next failure overwrites it.
     * Null, or a buffer of `capacity` bytes: the text, a JSON object or array, and its zero byte;
     * then zero bytes up to the last byte; and in the last byte the end mark 'J' (0x4A). So the
     * capacity is at least the length of the text plus 2. */
    char* json;
};

/* The payload of a failure that the plug-in raises is one JSON object without white space:
 *
 *     {"error_constant":"zvplaterr_invalidParameter","file":"dravik/tServo","line":98,
 *      "component":"dravik"}
 *
 *   "error_constant"      the name of the code, but "errCode" for jsonErrorsTypeMismatch; absent
 *                         where the platform layer raised it
 *   "file", "line"        the source unit and a number that stands for the place in it; both stay
 *                         from release to release. Of a parameter that is out of its bounds there
 *                         is nothing else: zvckmservo/parameters.h has the number of each
 *   "component"           always "dravik"
 *   "std_exception_what"  what an exception said that reached the boundary
 *   "internal_error"      what the operating system said: "api", "string" and, of errno, "code"
 *   "..._debug"           the raising library's own details
 *
 * Details never change an outcome: what there is no room for is left out from that member on, and
 * the code stands. A failure of a host operation keeps the payload that the host gave it. */

/* The codes that the plug-in raises. Two numbers have two names each, for failures of one kind;
 * "error_constant" says which of them it was. The last two codes stay inside the plug-in: a host
 * meets them only if an operation of its own reports them. */
enum {
    zvplaterr_memoryFull = -52000,                       /* the allocator is exhausted */
    zvplaterr_softwareFaultPLATInternalUseOnly = -52003, /* no mutex, unforeseen exception */
    jsonErrorsNotAnObject = -52004,                      /* JSON, but no object */
    jsonErrorsTypeMismatch = -52004,                     /* JSON value of another type */
    zvplaterr_invalidParameter = -52005,                 /* a value out of its bounds */
    jsonErrorsInvalidJSON = -52005,                      /* text that is not JSON */
    zvplaterr_resourceNotFound = -52006,                 /* a file or member is missing */
    zvplaterr_osFault = -52008                           /* the operating system failed */
};

static_assert(offsetof(zverr_Status, code) == 0, "code comes first");
static_assert(offsetof(zverr_Status, capacity) == 4, "capacity at byte 4");
static_assert(offsetof(zverr_Status, reallocJson) == 8, "reallocJson at byte 8");
static_assert(offsetof(zverr_Status, json) == 8 + sizeof(void*), "json behind one pointer");
static_assert(sizeof(zverr_Status) == 8 + 2 * sizeof(void*), "nothing else in the record");

#ifdef __cplusplus
}
#endif

#endif
