/* Producers of NTP samples: a true time and the machine's at the same moment, in a segment that
 * exists in this process only, or as a datagram to a socket of its own. */
#include "machine.h"

#include <signal.h>
#include <sys/mman.h>
#include <sys/shm.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

static const int64_t kHourNs = 3600LL * kSecondNs;
enum { kKey = 0x4e545030, kId = 0x5a000000, kMagic = 0x534f434b, kNotSynchronised = 3 };

static void put32(unsigned char* at, int64_t value)
{
    const int32_t narrow = (int32_t)value;
    memcpy(at, &narrow, sizeof narrow);
}

static int64_t putSeconds(unsigned char* at, int64_t seconds, int wide)
{
    if (wide) {
        memcpy(at, &seconds, sizeof seconds);
    } else {
        put32(at, seconds);
    }
    return wide ? 8 : 4;
}

/* What the next sample is to be spoilt by. */
static int isNext(const struct producer* producer, const char* word)
{
    const char* at = producer->spoilt;
    for (int i = 0; at && i < producer->produced; ++i) {
        at = strchr(at, '/');
        if (at) ++at;
    }
    const size_t length = strlen(word);
    return at && strncmp(at, word, length) == 0 && (at[length] == '/' || !at[length]);
}

/* A page ends before the last nanoseconds of the sample: what is read of it can be noticed. */
static size_t pageSize(void) { return (size_t)sysconf(_SC_PAGESIZE); }
static size_t onFirstPage(const struct producer* producer)
{
    return producer->size == 96 ? 56 : 40;
}

/* A reader of the torn sample is here: the producer writes again under its eyes. */
static void tear(int signal, siginfo_t* fault, void* context)
{
    (void)context;
    for (int i = 0; i < machine()->producerCount; ++i) {
        unsigned char* const segment = machine()->producers[i].segment;
        unsigned char* const page = segment + onFirstPage(&machine()->producers[i]);
        unsigned char* const at = fault->si_addr;
        if (!segment || at < page || at >= page + pageSize()) continue;
        (void)mprotect(page, pageSize(), PROT_READ | PROT_WRITE);
        ++segment[4];
        return;
    }
    (void)sigaction(signal, &(struct sigaction){.sa_handler = SIG_DFL}, NULL);
}

static void putSample(struct producer* producer, int64_t systemNs, int64_t referenceNs)
{
    unsigned char* const segment = producer->segment;
    const int wide = producer->size == 96;
    unsigned char* const reference = segment + 8;
    unsigned char* const system = segment + (wide ? 24 : 16);
    unsigned char* const leap = segment + (wide ? 36 : 24);
    int32_t count = 0;
    memcpy(&count, segment + 4, sizeof count);
    (void)mprotect(segment + onFirstPage(producer), pageSize(), PROT_READ | PROT_WRITE);
    put32(segment, (int64_t)producer->mode);
    put32(segment + 4, count + 2);
    put32(reference + putSeconds(reference, referenceNs / kSecondNs, wide),
          referenceNs % kSecondNs / 1000);
    put32(system + putSeconds(system, systemNs / kSecondNs, wide), systemNs % kSecondNs / 1000);
    put32(leap, isNext(producer, "leap") ? kNotSynchronised : (int64_t)producer->leap);
    put32(leap + 4, -20);
    put32(leap + 16, producer->micro != 0 ? 0 : referenceNs % kSecondNs);
    put32(leap + 20, producer->micro != 0 ? 0 : systemNs % kSecondNs);
    put32(leap + 12, 1);
    if (!isNext(producer, "torn")) return;
    struct sigaction action = {.sa_sigaction = tear, .sa_flags = SA_SIGINFO};
    (void)sigaction(SIGSEGV, &action, NULL);
    (void)mprotect(segment + onFirstPage(producer), pageSize(), PROT_NONE);
}

static int sendSample(struct producer* producer, int64_t systemNs, int64_t referenceNs)
{
    const double wrong = producer->pulse != 0 ? 7 : 0;
    const double offset = (double)(referenceNs - systemNs) * 1e-9 + wrong;
    const int wide = producer->bits == 64;
    unsigned char datagram[41] = {0};
    int64_t size = putSeconds(datagram, systemNs / kSecondNs, wide);
    size += putSeconds(datagram + size, systemNs % kSecondNs / 1000, wide);
    memcpy(datagram + size, &offset, sizeof offset);
    put32(datagram + size + 8, (int64_t)producer->pulse);
    put32(datagram + size + 12, isNext(producer, "leap") ? kNotSynchronised : 0);
    put32(datagram + size + 20, isNext(producer, "magic") ? 1 : kMagic);
    size += 24 + isNext(producer, "long") - isNext(producer, "short");
    struct sockaddr_un to = {AF_UNIX, ""};
    (void)snprintf(to.sun_path, sizeof to.sun_path, "%.107s", producer->path);
    return sendto(producer->file, datagram, (size_t)size, MSG_DONTWAIT, (struct sockaddr*)&to,
                  sizeof to) == size;
}

/* Nothing is produced for a program that is not there yet. A datagram has microseconds only. */
void produce(struct producer* producer)
{
    struct measurement* const reading = &producer->reading;
    if (producer->produced >= producer->count || isMissing(reading)) return;
    int64_t systemNs = cutStamp(reading, timeOf(&machine()->clocks[0]));
    int64_t referenceNs = trueNs() + (int64_t)producer->offsetNs + producer->steppedNs;
    referenceNs = cutStamp(reading, referenceNs + measurementErrorNs(reading));
    const int64_t agoNs = isNext(producer, "old") ? kHourNs : 0;
    if (producer->unit < 0) {
        referenceNs -= systemNs % 1000;
        systemNs -= systemNs % 1000;
        producer->produced += sendSample(producer, systemNs - agoNs, referenceNs - agoNs);
    } else if (producer->segment) {
        putSample(producer, systemNs - agoNs, referenceNs - agoNs);
        ++producer->produced;
    }
}

void startProducer(struct producer* producer)
{
    if (producer->unit < 0) {
        producer->file = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
        if (producer->file < 0) giveUp("no socket for", producer->path);
    } else if (producer->absent == 0) {
        producer->size = producer->bits == 64 ? 96 : 80;
    }
}

int shmget(key_t key, size_t size, int flags)
{
    for (int i = 0; i < machine()->producerCount; ++i) {
        struct producer* const producer = &machine()->producers[i];
        if (producer->unit < 0 || key != kKey + (int)producer->unit) continue;
        if (producer->size == 0 && !(flags & IPC_CREAT)) return fail(ENOENT);
        if (producer->size != 0 && (flags & IPC_CREAT) && (flags & IPC_EXCL)) return fail(EEXIST);
        if (producer->size == 0) {
            char event[32];
            (void)snprintf(event, sizeof event, "segment %o", (unsigned)flags & 0777U);
            traceClock(&machine()->clocks[0], event);
            producer->size = size;
        }
        return size > producer->size ? fail(EINVAL) : kId + i;
    }
    return NEXT(shmget)(key, size, flags);
}

static struct producer* producerOf(int id)
{
    return id >= kId && id < kId + kProducers ? &machine()->producers[id - kId] : NULL;
}

void* shmat(int id, const void* address, int flags)
{
    struct producer* const producer = producerOf(id);
    if (!producer) return NEXT(shmat)(id, address, flags);
    if (!producer->segment) {
        const int protection = PROT_READ | PROT_WRITE;
        unsigned char* const pages =
            mmap(NULL, 2 * pageSize(), protection, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
        if (pages == MAP_FAILED) giveUp("no memory for", producer->path);
        producer->segment = pages + pageSize() - onFirstPage(producer);
    }
    return producer->segment;
}

int shmdt(const void* address)
{
    for (int i = 0; i < machine()->producerCount; ++i)
        if (address == machine()->producers[i].segment) return 0;
    return NEXT(shmdt)(address);
}

int shmctl(int id, int operation, struct shmid_ds* state)
{
    const struct producer* const producer = producerOf(id);
    if (!producer) return NEXT(shmctl)(id, operation, state);
    if (operation != IPC_STAT) return 0;
    memset(state, 0, sizeof *state);
    state->shm_segsz = producer->size;
    return 0;
}
