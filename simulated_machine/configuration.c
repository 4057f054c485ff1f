/* Reads the statements that machine.h lists. */
#include "machine.h"

#include <fcntl.h>
#include <stddef.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/timex.h>
#include <unistd.h>

static char where[300]; /* "FILE:LINE: " of the statement being read */

_Noreturn void giveUp(const char* what, const char* which)
{
    (void)fprintf(stderr, "simulated machine: %s%s: %s\n", where, what, which);
    _exit(99);
}

void* nextFunction(const char* name)
{
    void* const found = dlsym(RTLD_NEXT, name);
    if (!found) giveUp("not in the C library", name);
    return found;
}

double quantityIn(const char* text)
{
    static const struct {
        const char* name;
        double factor;
    } units[] = {{"", 1},       {"ns", 1},     {"us", 1e3}, {"ms", 1e6},  {"s", 1e9},
                 {"min", 60e9}, {"h", 3600e9}, {"ppb", 1},  {"ppm", 1e3}, {"%", 0.01}};
    char* end = NULL;
    const double number = strtod(text, &end);
    for (size_t i = 0; end != text && i < sizeof units / sizeof *units; ++i)
        if (strcmp(end, units[i].name) == 0) return number * units[i].factor;
    giveUp("not a quantity", text);
}

static struct series seriesIn(const char* path)
{
    struct series series = {NULL, 0};
    char line[64];
    FILE* const file = fopen(path, "re");
    if (!file) giveUp("cannot read", path);
    while (fgets(line, sizeof line, file)) {
        double* const more = realloc(series.values, (series.count + 1) * sizeof *series.values);
        if (!more) giveUp("too long", path);
        series.values = more;
        series.values[series.count++] = strtod(line, NULL);
    }
    (void)fclose(file);
    return series;
}

enum kind { kNumber, kLetters, kFile };
struct key {
    const char* name;
    enum kind kind;
    size_t at, size;
};

static const struct key kOfMachine[] = {
    {"seed", kNumber, offsetof(struct machine, seed), 0},
    {"start", kNumber, offsetof(struct machine, startNs), 0},
    {"tai", kNumber, offsetof(struct machine, taiS), 0},
    {"grid", kNumber, offsetof(struct machine, gridNs), 0},
    {"reading", kNumber, offsetof(struct machine, readingNs), 0},
    {"wake", kNumber, offsetof(struct machine, wakeNs), 0},
    {"pace", kNumber, offsetof(struct machine, paceNs), 0},
    {NULL, kNumber, 0, 0},
};
static const struct key kOfClock[] = {
    {"offset", kNumber, offsetof(struct clock, offsetNs), 0},
    {"frequency", kNumber, offsetof(struct clock, frequencyPpb), 0},
    {"white", kNumber, offsetof(struct clock, whitePpb), 0},
    {"wander", kNumber, offsetof(struct clock, wanderPpb), 0},
    {"flicker", kNumber, offsetof(struct clock, flickerPpb), 0},
    {"sine", kNumber, offsetof(struct clock, sinePpb), 0},
    {"period", kNumber, offsetof(struct clock, periodNs), 0},
    {"ramp", kNumber, offsetof(struct clock, rampPpb), 0},
    {"max", kNumber, offsetof(struct clock, maxPpb), 0},
    {"delay", kNumber, offsetof(struct clock, delayNs), 0},
    {"status", kNumber, offsetof(struct clock, status), 0},
    {"file", kFile, offsetof(struct clock, filePpb), 0},
    {"quirks", kLetters, offsetof(struct clock, quirks), sizeof((struct clock*)0)->quirks},
    {NULL, kNumber, 0, 0},
};
static const struct key kOfProducer[] = {
    {"interval", kNumber, offsetof(struct producer, intervalNs), 0},
    {"first", kNumber, offsetof(struct producer, firstNs), 0},
    {"count", kNumber, offsetof(struct producer, count), 0},
    {"offset", kNumber, offsetof(struct producer, offsetNs), 0},
    {"bits", kNumber, offsetof(struct producer, bits), 0},
    {"mode", kNumber, offsetof(struct producer, mode), 0},
    {"absent", kNumber, offsetof(struct producer, absent), 0},
    {"micro", kNumber, offsetof(struct producer, micro), 0},
    {"pulse", kNumber, offsetof(struct producer, pulse), 0},
    {"leap", kNumber, offsetof(struct producer, leap), 0},
    {"spoilt", kLetters, offsetof(struct producer, spoilt), sizeof((struct producer*)0)->spoilt},
    {NULL, kNumber, 0, 0},
};
static const struct key kOfMeasurement[] = {
    {"noise", kNumber, offsetof(struct measurement, deviationNs), 0},
    {"outliers", kNumber, offsetof(struct measurement, outlierShare), 0},
    {"delayed", kNumber, offsetof(struct measurement, delayedShare), 0},
    {"size", kNumber, offsetof(struct measurement, outlierNs), 0},
    {"delay", kNumber, offsetof(struct measurement, delayNs), 0},
    {"flicker", kNumber, offsetof(struct measurement, flickerNs), 0},
    {"granularity", kNumber, offsetof(struct measurement, granularityNs), 0},
    {"missing", kNumber, offsetof(struct measurement, missingShare), 0},
    {"errors", kFile, offsetof(struct measurement, errorsNs), 0},
    {NULL, kNumber, 0, 0},
};

static int set(void* record, const struct key* keys, const char* name, const char* value)
{
    while (keys->name && strcmp(keys->name, name) != 0)
        ++keys;
    if (!keys->name) return 0;
    char* const place = (char*)record + keys->at;
    if (keys->kind == kNumber) *(double*)(void*)place = quantityIn(value);
    if (keys->kind == kFile) *(struct series*)(void*)place = seriesIn(value);
    if (keys->kind == kLetters) (void)snprintf(place, keys->size, "%s", value);
    return 1;
}

int setClock(struct clock* clock, const char* name, const char* value)
{
    return set(clock, kOfClock, name, value);
}

int setReading(struct measurement* reading, const char* name, const char* value)
{
    return set(reading, kOfMeasurement, name, value);
}

/* KEY=VALUE... of a record and of the errors of its readings. */
static void setAll(char** rest, void* record, const struct key* keys, struct measurement* reading)
{
    for (char* word = strtok_r(NULL, " ", rest); word; word = strtok_r(NULL, " ", rest)) {
        char* const equals = strchr(word, '=');
        if (!equals) giveUp("not KEY=VALUE", word);
        *equals = 0;
        if (!set(record, keys, word, equals + 1) &&
            !(reading && set(reading, kOfMeasurement, word, equals + 1)))
            giveUp("unknown", word);
    }
}

static void addClock(struct machine* made, const char* name, char** rest)
{
    const int isSystem = strcmp(name, "system") == 0;
    if (!isSystem && made->clockCount == kClocks) giveUp("too many clocks", name);
    struct clock* const clock = &made->clocks[isSystem ? 0 : made->clockCount++];
    (void)snprintf(clock->name, sizeof clock->name, "%s", name);
    clock->maxPpb = isSystem ? 500e3 : 62.5e6;
    clock->delayNs = made->readingNs;
    clock->status = STA_UNSYNC;
    setAll(rest, clock, kOfClock, &clock->reading);
    clock->file = isSystem ? -1 : memfd_create("ptp", MFD_CLOEXEC);
}

static void addProducer(struct machine* made, int isSegment, const char* name, char** rest)
{
    if (made->producerCount == kProducers) giveUp("too many producers", name);
    struct producer* const producer = &made->producers[made->producerCount++];
    (void)snprintf(producer->path, sizeof producer->path, "%s", name);
    producer->unit = isSegment ? quantityIn(name) : -1;
    producer->bits = 64;
    producer->count = 1e18;
    setAll(rest, producer, kOfProducer, &producer->reading);
    producer->nextNs = producer->intervalNs > 0 ? (int64_t)producer->firstNs : INT64_MAX;
    startProducer(producer);
}

static double numberOf(const char* word, const char* const* words)
{
    for (int i = 0; words[i]; ++i)
        if (strcmp(words[i], word) == 0) return i;
    giveUp("unknown", word);
}

static void addEvent(struct machine* made, char** rest)
{
    static const char* const verbs[] = {"signal",  "run",    "step", "frequency",
                                        "silence", "resume", NULL};
    static const char* const signals[] = {"HUP", "INT", "TERM", NULL};
    const char* const at = strtok_r(NULL, " ", rest);
    const char* const verb = strtok_r(NULL, " ", rest);
    const int isCommand = verb && strcmp(verb, "run") == 0;
    const char* const text = strtok_r(NULL, isCommand ? "" : " ", rest);
    if (!at || !verb || !text) giveUp("not an event", at ? at : "");
    if (made->eventCount == kEvents) giveUp("too many events", at);
    struct event* const event = &made->events[made->eventCount++];
    event->atNs = (int64_t)quantityIn(at);
    event->verb = (enum verb)numberOf(verb, verbs);
    (void)snprintf(event->text, sizeof event->text, "%s", text);
    if (event->verb == kSignal) event->value = numberOf(text, signals);
    if (event->verb == kStep || event->verb == kFrequency) {
        const char* const value = strtok_r(NULL, " ", rest);
        event->value = quantityIn(value ? value : "");
    }
}

static void take(struct machine* made, char* statement)
{
    char* rest = NULL;
    const char* const word = strtok_r(statement, " ", &rest);
    if (!word || *word == '#') return;
    if (strcmp(word, "system") == 0) {
        addClock(made, word, &rest);
    } else if (strcmp(word, "emulator") == 0) {
        made->emulated = 1;
    } else if (strcmp(word, "at") == 0) {
        addEvent(made, &rest);
    } else {
        const char* const name = strtok_r(NULL, " ", &rest);
        if (!name) giveUp("not a statement", word);
        if (strcmp(word, "ptp") == 0) {
            addClock(made, name, &rest);
        } else if (strcmp(word, "shm") == 0 || strcmp(word, "sock") == 0) {
            addProducer(made, *word == 's' && word[1] == 'h', name, &rest);
        } else if (strcmp(word, "trace") == 0) {
            made->trace = fopen(name, "we");
            if (!made->trace) giveUp("cannot write", name);
            (void)fputs("elapsed_s,clock,error_ns,ordered_ppb,event\n", made->trace);
            setAll(&rest, made, kOfMachine, NULL);
        } else if (strcmp(word, "scenario") == 0) {
            addScenario(made, name, &rest);
        } else if (!set(made, kOfMachine, word, name)) {
            giveUp("unknown", word);
        }
    }
}

/* A scenario is read in the midst of the machine's statements. */
void readStatements(struct machine* made, const char* path,
                    void take(struct machine* made, char* statement))
{
    FILE* const file = fopen(path, "re");
    if (!file) giveUp("cannot read", path);
    char before[sizeof where];
    char line[512];
    memcpy(before, where, sizeof where);
    for (int number = 1; fgets(line, sizeof line, file); ++number) {
        line[strcspn(line, "\n")] = 0;
        (void)snprintf(where, sizeof where, "%.250s:%d: ", path, number);
        take(made, line);
    }
    memcpy(where, before, sizeof where);
    (void)fclose(file);
}

static struct noise seeded(const struct machine* made, int cause)
{
    struct noise noise = {(uint64_t)made->seed * 1000 + (uint64_t)cause, 0, 0};
    (void)uniform(&noise);
    noise.state ^= (uint64_t)(uniform(&noise) * 0x1p63); /* far from its neighbours */
    return noise;
}

static void seedReading(const struct machine* made, struct measurement* reading, int cause)
{
    reading->noise = seeded(made, cause);
    reading->chances = seeded(made, cause + 100);
    reading->delays = seeded(made, cause + 200);
    reading->misses = seeded(made, cause + 300);
    reading->flicker.noise = seeded(made, cause + 400);
}

/* A scenario has the same noise by whatever way its source is read. */
static void seedScenario(struct machine* made)
{
    const struct scenario* const scenario = &made->scenario;
    if (scenario->device) seedReading(made, &scenario->device->reading, 3);
    if (scenario->producer) seedReading(made, &scenario->producer->reading, 3);
}

/* A loader that cannot load this library goes on without it. Who must not do so looks for
 * FILE.loaded. */
static void leaveSign(const char* path)
{
    char sign[512];
    const int length = snprintf(sign, sizeof sign, "%s.loaded", path);
    FILE* const file = length < (int)sizeof sign ? fopen(sign, "we") : NULL;
    if (!file) giveUp("cannot write", sign);
    (void)fclose(file);
}

void configure(struct machine* made)
{
    made->startNs = 1e18;
    made->taiS = 37;
    made->gridNs = 1e7;
    made->readingNs = 20;
    made->clockCount = 1;
    char nothing[] = "";
    char* rest = nothing;
    addClock(made, "system", &rest);
    const char* const path = getenv("SIMULATED_MACHINE");
    if (!path) giveUp("SIMULATED_MACHINE", "not set");
    readStatements(made, path, take);
    leaveSign(path);
    for (int i = 0; i < made->clockCount; ++i) {
        struct clock* const clock = &made->clocks[i];
        clock->steppedNs = (int64_t)clock->offsetNs;
        clock->white = seeded(made, 10 * i + 1);
        clock->walk = seeded(made, 10 * i + 2);
        clock->flicker.noise = seeded(made, 10 * i + 5);
        seedReading(made, &clock->reading, 10 * i + 3);
    }
    for (int i = 0; i < made->producerCount; ++i)
        seedReading(made, &made->producers[i].reading, 10 * i + 4);
    seedScenario(made);
}
