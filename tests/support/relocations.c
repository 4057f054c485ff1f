/* A stand-in for the relocation library, steered by the environment:
 *   RELOCATIONS          "bindir=/x:sysconfdir=": new paths, an empty one too; others stay
 *   RELOCATIONS_FAIL_AT  number of the call, from 1 on, that fails
 *   RELOCATIONS_LOG      a file that each name asked for is added to */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

static int answer(const char* name, char* buffer, size_t size)
{
    const size_t length = strlen(name);
    const char* row = getenv("RELOCATIONS");
    memset(buffer, '#', size); /* what a result of 0 leaves is not to be read */
    for (; row != NULL; row = strchr(row, ':') != NULL ? strchr(row, ':') + 1 : NULL) {
        if (strncmp(row, name, length) == 0 && row[length] == '=') {
            const char* const path = row + length + 1;
            const size_t pathLength = strcspn(path, ":");
            if (pathLength >= size) return -1;
            memcpy(buffer, path, pathLength);
            buffer[pathLength] = 0;
            return 1;
        }
    }
    return 0;
}

#ifndef WITHOUT_SYMBOL
int get_relocated_dir(const char* name, char* buffer, size_t size)
{
    static int calls;
    const char* const failAt = getenv("RELOCATIONS_FAIL_AT");
    const char* const logName = getenv("RELOCATIONS_LOG");
    FILE* const log = logName != NULL ? fopen(logName, "a") : NULL;
    if (log != NULL) {
        (void)fprintf(log, "%s %zu\n", name, size);
        (void)fclose(log);
    }
    return failAt != NULL && ++calls == strtol(failAt, NULL, 10) ? -1 : answer(name, buffer, size);
}
#else
int unrelated(char* buffer) { return answer("", buffer, 1); }
#endif
