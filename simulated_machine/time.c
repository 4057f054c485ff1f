/* How time passes: oscillators go on in stretches of a grid of true time, so that their noise is
 * the same whatever a program does; what is to happen at a time happens while it passes. */
#include "machine.h"

#include <math.h>
#include <signal.h>

int64_t trueNs(void) { return (int64_t)machine()->startNs + machine()->elapsedNs; }

int64_t timeOf(const struct clock* clock)
{
    return (int64_t)machine()->startNs + clock->steered.wholeNs + clock->steppedNs;
}

/* (1 + y)(1 + u) - 1, without the 1 that would cost the small terms their last digits. */
double excessOf(const struct clock* clock)
{
    const double own = clock->ownPpb * 1e-9;
    const double ordered = clock->orderedPpb * 1e-9;
    return own + ordered + own * ordered;
}

static void passPhase(struct phase* phase, int64_t ns, double excess)
{
    phase->fractionNs += (double)ns * excess;
    const double carryNs = floor(phase->fractionNs);
    phase->fractionNs -= carryNs;
    phase->wholeNs += ns + (int64_t)carryNs;
}

void traceClock(const struct clock* clock, const char* event)
{
    const struct machine* const now = machine();
    if (!now->trace) return;
    const int64_t errorNs = timeOf(clock) - trueNs() - now->jumpedNs;
    (void)fprintf(now->trace, "%.9f,%s,%.3f,%.3f,%s\n", (double)now->elapsedNs * 1e-9, clock->name,
                  (double)errorNs + clock->steered.fractionNs, clock->orderedPpb, event);
    (void)fflush(now->trace);
}

static void beginStretch(struct clock* clock)
{
    const struct machine* const now = machine();
    const double seconds = (double)now->elapsedNs * 1e-9;
    const double rootSeconds = sqrt(now->gridNs * 1e-9);
    clock->ownPpb = clock->frequencyPpb + clock->walkedPpb + clock->rampedPpb +
                    clock->whitePpb / rootSeconds * normal(&clock->white) +
                    flickerOfAllan(&clock->flicker, clock->flickerPpb) +
                    clock->sinePpb * sineOfTurns(clock->turns);
    clock->walkedPpb += clock->wanderPpb * rootSeconds * normal(&clock->walk);
    clock->rampedPpb += clock->rampPpb * now->gridNs * 1e-9;
    if (clock->periodNs > 0) clock->turns += now->gridNs / clock->periodNs;
    if (clock->filePpb.count > 0) {
        const size_t at = (size_t)seconds;
        const size_t last = clock->filePpb.count - 1;
        clock->ownPpb += clock->filePpb.values[at < last ? at : last];
    }
}

static void passWithinStretch(int64_t ns)
{
    struct machine* const now = machine();
    for (int i = 0; i < now->clockCount; ++i) {
        struct clock* const clock = &now->clocks[i];
        passPhase(&clock->raw, ns, clock->ownPpb * 1e-9);
        passPhase(&clock->steered, ns, excessOf(clock));
    }
    now->elapsedNs += ns;
}

static void pass(int64_t untilNs)
{
    struct machine* const now = machine();
    while (now->elapsedNs < untilNs) {
        const int64_t endNs = untilNs < now->slotEndNs ? untilNs : now->slotEndNs;
        passWithinStretch(endNs - now->elapsedNs);
        if (now->elapsedNs < now->slotEndNs) continue;
        now->slotEndNs += (int64_t)now->gridNs;
        const int tracing = now->trace && now->paceNs > 0 && now->elapsedNs >= now->nextTraceNs;
        if (tracing) now->nextTraceNs += (int64_t)now->paceNs;
        for (int i = 0; i < now->clockCount; ++i) {
            beginStretch(&now->clocks[i]);
            if (tracing) traceClock(&now->clocks[i], "");
        }
    }
}

static void happen(struct event* event)
{
    static const int signals[] = {SIGHUP, SIGINT, SIGTERM};
    struct machine* const now = machine();
    if (event->verb == kSignal) {
        now->signalled = 1;
        (void)raise(signals[(int)event->value]);
        return;
    }
    if (event->verb == kRun) {
        if (system(event->text) != 0) giveUp("a command failed", event->text); /* NOLINT: wanted */
        return;
    }
    if (event->verb == kClock || event->verb == kReference) {
        playScenario(now, event);
        return;
    }
    if (event->verb == kJump) now->jumpedNs += (int64_t)event->value;
    const int isStep = event->verb == kStep || event->verb == kJump;
    const int isSilence = event->verb == kSilence || event->verb == kResume;
    for (int i = 0; i < now->clockCount; ++i) {
        struct clock* const clock = &now->clocks[i];
        if (strcmp(event->text, clock->name) != 0) continue;
        if (isStep) clock->steppedNs += (int64_t)event->value;
        if (event->verb == kFrequency) clock->frequencyPpb += event->value;
        if (isSilence) clock->silent = event->verb == kSilence;
        traceClock(clock, "event");
    }
    for (int i = 0; i < now->producerCount; ++i) {
        struct producer* const producer = &now->producers[i];
        if (strcmp(event->text, producer->path) != 0) continue;
        if (isStep) producer->steppedNs += (int64_t)event->value;
        if (isSilence) producer->silent = event->verb == kSilence;
    }
}

int64_t nextEventNs(void)
{
    const struct machine* const now = machine();
    int64_t nextNs = INT64_MAX;
    for (int i = 0; i < now->eventCount; ++i)
        if (now->events[i].atNs < nextNs) nextNs = now->events[i].atNs;
    for (int i = 0; i < now->producerCount; ++i)
        if (now->producers[i].nextNs < nextNs) nextNs = now->producers[i].nextNs;
    return nextNs;
}

/* Something is over before it happens, as it may read clocks itself. */
void advanceTo(int64_t elapsedNs)
{
    struct machine* const now = machine();
    for (int64_t nextNs = nextEventNs(); nextNs <= elapsedNs; nextNs = nextEventNs()) {
        pass(nextNs);
        for (int i = 0; i < now->eventCount; ++i) {
            if (now->events[i].atNs > nextNs) continue;
            now->events[i].atNs = INT64_MAX;
            happen(&now->events[i]);
        }
        for (int i = 0; i < now->producerCount; ++i) {
            struct producer* const producer = &now->producers[i];
            if (producer->nextNs > nextNs) continue;
            producer->nextNs += (int64_t)producer->intervalNs;
            if (!producer->silent) produce(producer);
        }
    }
    pass(elapsedNs);
}

void advance(int64_t ns) { advanceTo(machine()->elapsedNs + ns); }
