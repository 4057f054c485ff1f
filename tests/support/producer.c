/* Produces samples of a true time 5 ms ahead of the machine's, one every 20 ms.
 * Usage: producer shm UNIT wide|narrow MODE COUNT   into a shared memory segment
 *        producer sock PATH wide|narrow PULSE COUNT as datagrams; of a pulse, seconds are wrong
 * The first of them cannot be used: in a segment one that claims no synchronisation and one from an
 * hour ago, as datagrams also one too short and one of another kind. */
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/ipc.h>
#include <sys/shm.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <time.h>
#include <unistd.h>

static const int64_t kAheadNs = 5000000;
static const int64_t kHourNs = 3600LL * 1000000000;

static int wide;

static int64_t nowNs(void)
{
    struct timespec now;
    clock_gettime(CLOCK_REALTIME, &now);
    return (int64_t)now.tv_sec * 1000000000 + now.tv_nsec;
}

static void pause20ms(void)
{
    const struct timespec time = {0, 20000000};
    nanosleep(&time, NULL);
}

static void put32(unsigned char* at, int64_t value)
{
    const int32_t narrow = (int32_t)value;
    memcpy(at, &narrow, sizeof narrow);
}

/* Seconds and microseconds; returns the bytes written. */
static size_t putTime(unsigned char* at, int64_t ns, int microsecondsAre64)
{
    const int64_t seconds = ns / 1000000000;
    const int64_t microseconds = ns % 1000000000 / 1000;
    if (!wide) {
        put32(at, seconds);
        put32(at + 4, microseconds);
        return 8;
    }
    memcpy(at, &seconds, 8);
    if (!microsecondsAre64) {
        put32(at + 8, microseconds);
        return 12;
    }
    memcpy(at + 8, &microseconds, 8);
    return 16;
}

static void putSample(volatile unsigned char* shared, int mode, int64_t systemNs, int leap)
{
    unsigned char* const segment = (unsigned char*)shared;
    const size_t leapAt = wide ? 36 : 24;
    int32_t count = 0;
    memcpy(&count, segment + 4, 4);
    put32(segment, mode);
    put32(segment + 4, count + 1);
    putTime(segment + 8, systemNs + kAheadNs, 0);
    putTime(segment + (wide ? 24 : 16), systemNs, 0);
    put32(segment + leapAt, leap);
    put32(segment + leapAt + 16, (systemNs + kAheadNs) % 1000000000);
    put32(segment + leapAt + 20, mode == 1 ? systemNs % 1000000000 : 0); /* 0: unknown */
    put32(segment + 4, count + 2);
    __sync_synchronize();
    put32(segment + leapAt + 12, 1);
}

static int produceShared(int unit, int mode, int count)
{
    const int id = shmget(0x4e545030 + unit, wide ? 96 : 80, IPC_CREAT | 0600);
    unsigned char* const segment = shmat(id, NULL, 0);
    if ((intptr_t)segment == -1) return 1;
    for (int i = 0; i < count; ++i) {
        putSample(segment, mode, nowNs() - (i == 1 ? kHourNs : 0), i == 0 ? 3 : 0);
        pause20ms();
    }
    return 0;
}

static size_t makeDatagram(unsigned char* datagram, int64_t systemNs, int pulse, int magic)
{
    const double offset = (double)kAheadNs * 1e-9 + (pulse ? 7 : 0);
    const size_t size = putTime(datagram, systemNs, 1);
    memcpy(datagram + size, &offset, 8);
    put32(datagram + size + 8, pulse);
    put32(datagram + size + 12, 0);
    put32(datagram + size + 16, 0);
    put32(datagram + size + 20, magic);
    return size + 24;
}

static int produceDatagrams(const char* path, int pulse, int count)
{
    struct sockaddr_un address = {AF_UNIX, ""};
    strncpy(address.sun_path, path, sizeof address.sun_path - 1);
    const int fd = socket(AF_UNIX, SOCK_DGRAM, 0);
    if (connect(fd, (const struct sockaddr*)&address, sizeof address) != 0) return 1;
    for (int i = 0; i < count; ++i) {
        unsigned char datagram[40] = {0};
        const int magic = i == 2 ? 1 : 0x534f434b;
        const size_t size = makeDatagram(datagram, nowNs() - (i == 1 ? kHourNs : 0), pulse, magic);
        if (send(fd, datagram, i == 0 ? size - 1 : size, 0) < 0) return 1;
        pause20ms();
    }
    return 0;
}

static int number(const char* text) { return (int)strtol(text, NULL, 10); }

int main(int argc, char** argv)
{
    if (argc != 6) return 2;
    wide = strcmp(argv[3], "wide") == 0;
    const int detail = number(argv[4]);
    const int count = number(argv[5]);
    if (strcmp(argv[1], "shm") == 0) return produceShared(number(argv[2]), detail, count);
    return produceDatagrams(argv[2], detail, count);
}
