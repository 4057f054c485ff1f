/* A host in C: loads the library, uses it, closes it, and finds it gone from the process, time
 * after time without growing; from a thread, too, that has been told to end. Usage: unload_test
 * LIBRARY ROUNDS */

#include "support/hostParts.h"
#include "zvckmservo/parameters.h"

#include <dlfcn.h>
#include <malloc.h>
#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <sys/resource.h>

static int32_t offsetPpb = 0;
static int32_t failure = 0;
static int finished = 0;

static void readClock(uint64_t* timeNs, zverr_Status* status)
{
    (void)status;
    pthread_testcancel();
    *timeNs = 4000000000U;
}

static void stepTime(int64_t deltaNs, zverr_Status* status)
{
    (void)deltaNs;
    (void)status;
}

static void getFrequency(int32_t* ppb, zverr_Status* status)
{
    pthread_testcancel();
    status->code =
        failure; /* makes the plug-in throw and catch: unwinding must not pin it either */
    *ppb = offsetPpb;
}

static void setFrequency(int32_t ppb, zverr_Status* status)
{
    (void)status;
    offsetPpb = ppb;
}

static int32_t getLimit(zverr_Status* status)
{
    (void)status;
    pthread_testcancel();
    return 500000;
}

static void check(int good, const char* what)
{
    if (good) return;
    (void)fprintf(stderr, "unload_test: %s\n", what);
    exit(1);
}

static void* bind(void* library, const char* name)
{
    void* const function = dlsym(library, name);
    check(function != NULL, name);
    return function;
}

/* NOLINTNEXTLINE(bugprone-macro-parentheses): what it declares is a name. */
#define BIND(f) __extension__ __typeof__(&zvckmservo_##f) f = bind(library, "zvckmservo_" #f)

static void useAndClose(const char* path)
{
    void* const library = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    check(library != NULL, "dlopen failed");
    BIND(initialize);
    BIND(adjustTime);
    BIND(getTime);
    BIND(writeServoConfigJson);
    BIND(applyMetaData);
    BIND(finalize);

    zvckmservo_HostTable host =
        hostTable(readClock, stepTime, getFrequency, setFrequency, getLimit, getLimit);
    zverr_Status status = {0, 0, noReallocJson, NULL};
    uint64_t now = 0;

    initialize(&host, &status);
    adjustTime(&host, 1000000000U, 1000000000U, &status);
    failure = -5;
    adjustTime(&host, 2000000000U, 2000012000U, &status);
    check(status.code == -5, "the clock's failure did not arrive");
    failure = 0;
    status.code = 0;
    getTime(&host, &now, &status);
    check(status.code == 0 && now == 4000000000U, "the clock's time did not arrive");
    for (int i = 0; i < zvckmservo_kParameterCount; ++i) {
        const zvckmservo_Parameter* const parameter = &zvckmservo_parameters[i];
        char document[64];
        (void)snprintf(document, sizeof document, "{\"%s\":%s}", parameter->key,
                       parameter->initialText);
        check(writeServoConfigJson(&host, document, &status) == 0, parameter->key);
    }
    applyMetaData(&host, /* looks for a file and logs */
                  "{\"selectedTRInstID\":\"a\",\"TRs\":{\"a\":{\"type\":\"IEEE 1588-2008 BC\"}}}",
                  &status);
    check(status.code == 0, "the metadata was not taken");
    finalize(&host);
    check(host.servoHandle == NULL, "the servo is still there");

    check(dlclose(library) == 0, "dlclose failed");
    check(dlopen(path, RTLD_NOW | RTLD_NOLOAD) == NULL, "still loaded after dlclose");
}

/* Ends at the first cancellation point behind the library: none inside takes effect. */
static void* useCancelled(void* path)
{
    pthread_cancel(pthread_self());
    useAndClose(path);
    finished = 1;
    pthread_testcancel();
    return NULL;
}

/* Bytes in allocated blocks. */
static size_t allocated(void) { return mallinfo2().uordblks; }

/* The most memory that was resident so far, in KiB. */
static long resident(void)
{
    struct rusage usage;
    check(getrusage(RUSAGE_SELF, &usage) == 0, "no resource usage");
    return usage.ru_maxrss;
}

int main(int argc, char** argv)
{
    check(argc == 3 || argc == 4, "usage: unload_test LIBRARY ROUNDS [KIB]");
    const long rounds = strtol(argv[2], NULL, 10);
    size_t bytes = 0;
    long kib = 0;
    for (long round = 0; round < rounds; ++round) {
        useAndClose(argv[1]);
        if (round > rounds / 10) continue; /* what is allocated only once is there by then */
        bytes = allocated();
        kib = resident();
    }
    const long moreBytes = (long)(allocated() - bytes);
    const long moreKib = resident() - kib;
    printf("%ld rounds: %ld bytes and %ld KiB more\n", rounds, moreBytes, moreKib);
    check(moreBytes < 4096, "allocated memory grows"); /* the loader's own lists come and go */
    check(argc == 3 || moreKib <= strtol(argv[3], NULL, 10), "resident memory grows");

    pthread_t thread = 0;
    void* result = NULL;
    check(pthread_create(&thread, NULL, useCancelled, argv[1]) == 0, "no thread");
    pthread_join(thread, &result);
    check(finished && result == PTHREAD_CANCELED,
          "the cancelled thread did not end where it should");
    return 0;
}
