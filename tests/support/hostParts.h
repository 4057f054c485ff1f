/* What a host is made of, for the hosts of tests, fuzzers and benchmarks; C and C++. */
#pragma once

#include "zvckmservo/servo.h"

#include <stdlib.h>
#include <string.h>

/* A table with these six operations and nothing else in it. */
static inline zvckmservo_HostTable
hostTable(void (*getTime)(uint64_t* timeNs, zverr_Status* status),
          void (*stepTime)(int64_t deltaNs, zverr_Status* status),
          void (*getFrequency)(int32_t* offsetPpb, zverr_Status* status),
          void (*setFrequency)(int32_t offsetPpb, zverr_Status* status),
          int32_t (*getMaxFrequencyOffset)(zverr_Status* status),
          int32_t (*getMinFrequencyOffset)(zverr_Status* status))
{
    zvckmservo_HostTable table;
    memset(&table, 0, sizeof table);
    table.getTime = getTime;
    table.stepTime = stepTime;
    table.getFrequency = getFrequency;
    table.setFrequency = setFrequency;
    table.getMaxFrequencyOffset = getMaxFrequencyOffset;
    table.getMinFrequencyOffset = getMinFrequencyOffset;
    return table;
}

/* A reallocJson that gives exactly what is asked for, in a fresh allocation, so that any step out
 * of it shows. */
static inline bool exactReallocJson(zverr_Status* status, uint32_t size)
{
    char* text = NULL; // NOLINT(modernize-use-nullptr): it is C, too
    if (size > 0) {
        if (size <= status->capacity) return true;
        text = (char*)calloc(size, 1);
        if (!text) return false;
        const char* const kept = status->json ? status->json : "{}";
        memcpy(text, kept, strlen(kept) + 1);
        text[size - 1] = 'J';
    }
    free(status->json);
    status->json = text;
    status->capacity = size;
    return true;
}

/* One that never has a buffer to give. */
static inline bool noReallocJson(zverr_Status* status, uint32_t size)
{
    (void)status;
    return size == 0;
}
