/* Produces samples of a true time 5 ms ahead of the machine's, one every 20 ms until it is killed.
 * Usage: producer shm UNIT   into a shared memory segment that a consumer makes
 *        producer sock PATH  as datagrams */
#define _GNU_SOURCE
#include <stddef.h>
#include <stdint.h>
#include <stdlib.h>
#include <string.h>
#include <sys/ipc.h>
#include <sys/shm.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <sys/un.h>
#include <time.h>

static const int kAheadNs = 5000000;

struct segment {
    int mode, count;
    time_t trueSeconds;
    int trueMicroseconds;
    time_t systemSeconds;
    int systemMicroseconds, leap, precision, samples;
    volatile int valid;
    unsigned trueNanoseconds, systemNanoseconds;
    int unused[8];
};

struct datagram {
    struct timeval systemTime;
    double offset; /* s, true minus machine's time */
    int pulse, leap, unused, magic;
};

static void putSample(struct segment* segment, int64_t systemNs)
{
    const int64_t trueNs = systemNs + kAheadNs;
    segment->trueSeconds = (time_t)(trueNs / 1000000000);
    segment->trueMicroseconds = (int)(trueNs % 1000000000 / 1000);
    segment->trueNanoseconds = (unsigned)(trueNs % 1000000000);
    segment->systemSeconds = (time_t)(systemNs / 1000000000);
    segment->systemMicroseconds = (int)(systemNs % 1000000000 / 1000);
    segment->systemNanoseconds = (unsigned)(systemNs % 1000000000);
    __sync_synchronize();
    segment->valid = 1;
}

static void sendSample(int socket, const char* path, int64_t systemNs)
{
    struct sockaddr_un address = {AF_UNIX, ""};
    strncpy(address.sun_path, path, sizeof address.sun_path - 1);
    const struct datagram datagram = {
        {(time_t)(systemNs / 1000000000), (suseconds_t)(systemNs % 1000000000 / 1000)},
        kAheadNs * 1e-9,
        0,
        0,
        0,
        0x534f434b};
    (void)sendto(socket, &datagram, sizeof datagram, 0, (const struct sockaddr*)&address,
                 sizeof address);
}

int main(int argc, char** argv)
{
    const struct timespec pause = {0, 20000000};
    if (argc != 3) return 2;
    const int isShared = strcmp(argv[1], "shm") == 0;
    const int unit = isShared ? (int)strtol(argv[2], NULL, 10) : 0;
    const int socketFile = socket(AF_UNIX, SOCK_DGRAM, 0);
    struct segment* segment = NULL;
    for (;; (void)nanosleep(&pause, NULL)) {
        const int id = isShared && !segment ? shmget(0x4e545030 + unit, sizeof *segment, 0) : -1;
        if (id >= 0) segment = shmat(id, NULL, 0);
        struct timespec now;
        (void)clock_gettime(CLOCK_REALTIME, &now);
        const int64_t systemNs = (int64_t)now.tv_sec * 1000000000 + now.tv_nsec;
        if (segment) putSample(segment, systemNs);
        if (!isShared) sendSample(socketFile, argv[2], systemNs);
    }
}
