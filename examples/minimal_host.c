/* The least that a host does: loads the plug-in, gives it the six operations of one clock, and
 * feeds it pairs. The clock is a pretended one, 30 ppm fast and 5 ms ahead, so nothing is touched.
 *
 *     cc $(pkg-config --cflags dravik) minimal_host.c -o minimal_host && ./minimal_host
 */
#include <dlfcn.h>
#include <inttypes.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <zvckmservo/servo.h>

/* The clock: what it shows, and the offset of its rate that the plug-in has ordered. */
static double aheadNs = 5e6;
static int32_t orderedPpb = 0;
static uint64_t trueNs = 1700000000000000000U;

static void getTime(uint64_t* timeNs, zverr_Status* status)
{
    (void)status;
    *timeNs = trueNs + (uint64_t)(int64_t)aheadNs;
}
static void stepTime(int64_t deltaNs, zverr_Status* status)
{
    (void)status;
    aheadNs += (double)deltaNs;
}
static void getFrequency(int32_t* offsetPpb, zverr_Status* status)
{
    (void)status;
    *offsetPpb = orderedPpb;
}
static void setFrequency(int32_t offsetPpb, zverr_Status* status)
{
    (void)status;
    orderedPpb = offsetPpb;
}
static int32_t highestOffset(zverr_Status* status)
{
    (void)status;
    return 500000;
}
static int32_t lowestOffset(zverr_Status* status)
{
    (void)status;
    return -500000;
}

/* A second passes. */
static void pass(void)
{
    trueNs += 1000000000U;
    aheadNs += 30000.0 + orderedPpb;
}

/* The buffer of this host's status: text, zero bytes, and 'J' in the last byte. */
static bool reallocJson(zverr_Status* status, uint32_t size)
{
    if (size == 0 || size > status->capacity) {
        char* const text = size == 0 ? NULL : calloc(size, 1);
        if (size != 0 && text == NULL) return false;
        if (text != NULL) {
            memcpy(text, status->json != NULL ? status->json : "{}",
                   status->json != NULL ? strlen(status->json) : 2);
            text[size - 1] = 'J';
        }
        free(status->json);
        status->json = text;
        status->capacity = size;
    }
    return true;
}

static void* bind(void* library, const char* name)
{
    void* const symbol = dlsym(library, name);
    if (symbol == NULL) {
        fprintf(stderr, "%s\n", dlerror());
        exit(1);
    }
    return symbol;
}

int main(int argc, char** argv)
{
    void* const library = dlopen(argc > 1 ? argv[1] : "libdravik.so.1", RTLD_NOW | RTLD_LOCAL);
    if (library == NULL) {
        fprintf(stderr, "%s\n", dlerror());
        return 1;
    }
    __typeof__(&zvckmservo_initialize) initialize = bind(library, "zvckmservo_initialize");
    __typeof__(&zvckmservo_adjustTime) adjustTime = bind(library, "zvckmservo_adjustTime");
    __typeof__(&zvckmservo_finalize) finalize = bind(library, "zvckmservo_finalize");

    zvckmservo_HostTable host = {0};
    host.getTime = getTime;
    host.stepTime = stepTime;
    host.getFrequency = getFrequency;
    host.setFrequency = setFrequency;
    host.getMaxFrequencyOffset = highestOffset;
    host.getMinFrequencyOffset = lowestOffset;

    zverr_Status status = {0, 0, reallocJson, NULL};
    initialize(&host, &status);
    for (int second = 0; second < 20 && status.code >= 0; ++second) {
        uint64_t clockNs;
        getTime(&clockNs, &status);
        adjustTime(&host, trueNs, clockNs, &status);
        printf("%2d s  error %11.1f ns  frequency %+6" PRId32 " ppb\n", second, aheadNs,
               orderedPpb);
        pass();
    }
    const int failed = status.code < 0;
    if (failed) fprintf(stderr, "%" PRId32 " %s\n", status.code, status.json ? status.json : "");
    if (status.json != NULL) status.reallocJson(&status, 0);
    finalize(&host);
    dlclose(library);
    return failed;
}
