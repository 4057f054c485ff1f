/* A scenario: a file that says how one clock and one source are, and what becomes of them. */
#include "machine.h"

static int isOneOf(const char* word, const char* const* words)
{
    while (*words && strcmp(word, *words) != 0)
        ++words;
    return *words != NULL;
}

/* What a change is about: a clock, or readings and the interval at which they come. */
struct subject {
    struct clock* clock;
    struct measurement* reading;
    double* intervalNs; /* NULL: a program reads when it likes to */
};

static struct subject subjectOf(struct scenario* scenario, int isClock)
{
    struct producer* const producer = scenario->producer;
    if (isClock) return (struct subject){scenario->clock, NULL, NULL};
    if (scenario->device) return (struct subject){NULL, &scenario->device->reading, NULL};
    return (struct subject){NULL, &producer->reading, &producer->intervalNs};
}

static int changeOne(const struct subject* subject, const char* name, const char* value)
{
    static const char* const ofClock[] = {"offset", "frequency", "white", "wander", "flicker",
                                          "sine",   "period",    "ramp",  NULL};
    if (subject->clock) return isOneOf(name, ofClock) && setClock(subject->clock, name, value);
    if (strcmp(name, "interval") != 0)
        return strcmp(name, "errors") != 0 && setReading(subject->reading, name, value);
    const double intervalNs = quantityIn(value);
    if (intervalNs < 1) giveUp("out of range", value);
    if (subject->intervalNs) *subject->intervalNs = intervalNs;
    return 1;
}

static void change(const struct subject* subject, char* words)
{
    char* rest = NULL;
    char* word = strtok_r(words, " \t", &rest);
    if (!word) giveUp("lacks", "KEY=VALUE");
    for (; word; word = strtok_r(NULL, " \t", &rest)) {
        char* const equals = strchr(word, '=');
        if (!equals) giveUp("not KEY=VALUE", word);
        *equals = 0;
        if (!changeOne(subject, word, equals + 1)) giveUp("unknown", word);
    }
    if (subject->clock && subject->clock->sinePpb != 0 && subject->clock->periodNs <= 0)
        giveUp("lacks a period", "sine");
}

/* Later offset and frequency of a clock add up, the rest holds from then on. */
static void changeLater(struct subject subject, char* words)
{
    struct clock* const clock = subject.clock;
    if (!clock) {
        change(&subject, words);
        return;
    }
    struct clock next = *clock;
    next.offsetNs = next.frequencyPpb = 0;
    subject.clock = &next;
    change(&subject, words);
    next.frequencyPpb += clock->frequencyPpb;
    next.steppedNs += (int64_t)next.offsetNs;
    *clock = next;
}

void playScenario(struct machine* made, struct event* event)
{
    changeLater(subjectOf(&made->scenario, event->verb == kClock), event->text);
    if (event->verb == kClock) traceClock(made->scenario.clock, "event");
}

/* Mistakes are found at the start: it is done to copies. */
static void tryChange(struct machine* made, int isClock, const char* words)
{
    struct subject subject = subjectOf(&made->scenario, isClock);
    struct clock clock = *made->scenario.clock;
    struct measurement reading;
    char copy[sizeof made->events->text];
    if (strlen(words) >= sizeof copy) giveUp("too long", words);
    (void)snprintf(copy, sizeof copy, "%s", words);
    if (isClock) subject.clock = &clock;
    if (!isClock) subject.reading = &reading;
    subject.intervalNs = NULL;
    changeLater(subject, copy);
}

static void addEvent(struct machine* made, char* at, char* rest)
{
    static const char* const verbs[] = {"silence", "resume", "jump", "clock", "reference", NULL};
    struct event event = {(int64_t)quantityIn(at), kSilence, "", 0};
    const char* const verb = strtok_r(NULL, " \t", &rest);
    if (event.atNs < 1) giveUp("not after the start", at);
    if (event.atNs < made->scenario.lastNs) giveUp("before the statement above it", at);
    if (!verb || !isOneOf(verb, verbs)) giveUp("unknown", verb ? verb : "nothing");
    made->scenario.lastNs = event.atNs;
    while (strcmp(verb, verbs[event.verb - kSilence]) != 0)
        ++event.verb;
    const char* text = made->scenario.source;
    if (event.verb == kClock || event.verb == kReference) {
        text = rest;
        tryChange(made, event.verb == kClock, text);
    } else if (event.verb == kJump) {
        const char* const value = strtok_r(NULL, " \t", &rest);
        event.value = quantityIn(value ? value : "");
    }
    const char* const more = text == rest ? NULL : strtok_r(NULL, " \t", &rest);
    if (more) giveUp("too much", more);
    (void)snprintf(event.text, sizeof event.text, "%s", text);
    if (made->eventCount == kEvents) giveUp("too many events", at);
    made->events[made->eventCount++] = event;
}

static void take(struct machine* made, char* statement)
{
    char* rest = NULL;
    struct scenario* const scenario = &made->scenario;
    statement[strcspn(statement, "#")] = 0;
    const char* const word = strtok_r(statement, " \t", &rest);
    if (!word) return;
    if (strcmp(word, "clock") == 0 || strcmp(word, "reference") == 0) {
        const struct subject subject = subjectOf(scenario, *word == 'c');
        if (scenario->lastNs > 0) giveUp("comes after statements with a time", word);
        change(&subject, rest);
        if (subject.intervalNs && *subject.intervalNs > 0)
            scenario->producer->nextNs = (int64_t)scenario->producer->firstNs;
    } else if (strcmp(word, "at") == 0) {
        char* const at = strtok_r(NULL, " \t", &rest);
        addEvent(made, at ? at : "", rest);
    } else {
        giveUp("unknown", word);
    }
}

void addScenario(struct machine* made, const char* path, char** rest)
{
    struct scenario* const scenario = &made->scenario;
    const char* const clock = strtok_r(NULL, " ", rest);
    const char* const source = strtok_r(NULL, " ", rest);
    if (!clock || !source) giveUp("not FILE CLOCK SOURCE", path);
    if (scenario->clock) giveUp("a second scenario", path);
    for (int i = 0; i < made->clockCount; ++i) {
        if (strcmp(clock, made->clocks[i].name) == 0) scenario->clock = &made->clocks[i];
        if (i > 0 && strcmp(source, made->clocks[i].name) == 0) scenario->device = &made->clocks[i];
    }
    for (int i = 0; i < made->producerCount; ++i)
        if (strcmp(source, made->producers[i].path) == 0) scenario->producer = &made->producers[i];
    if (!scenario->clock) giveUp("no such clock above", clock);
    if (!scenario->device && !scenario->producer) giveUp("no such source above", source);
    (void)snprintf(scenario->source, sizeof scenario->source, "%s", source);
    readStatements(made, path, take);
}
