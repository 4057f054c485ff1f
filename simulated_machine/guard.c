/* The kernel itself refuses this process, and all that it starts, every call that could set a clock
 * of the real machine: whatever does not come by way of the functions of this library. */
#include "machine.h"

#include <linux/audit.h>
#include <linux/capability.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <stdarg.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

#if defined(__x86_64__)
static const uint32_t kArchitecture = AUDIT_ARCH_X86_64;
#elif defined(__aarch64__)
static const uint32_t kArchitecture = AUDIT_ARCH_AARCH64;
#elif defined(__arm__)
static const uint32_t kArchitecture = AUDIT_ARCH_ARM;
#elif defined(__i386__)
static const uint32_t kArchitecture = AUDIT_ARCH_I386;
#endif

static const long kSetters[] = {
    SYS_clock_settime,   SYS_clock_adjtime,   SYS_adjtimex, SYS_settimeofday,
#ifdef SYS_stime
    SYS_stime,
#endif
#ifdef SYS_clock_settime64
    SYS_clock_settime64, SYS_clock_adjtime64,
#endif
};
enum { kSetterCount = sizeof kSetters / sizeof *kSetters };

/* Where there is no filter nothing can be set without the permission. */
static void dropPermission(void)
{
    struct __user_cap_header_struct header = {_LINUX_CAPABILITY_VERSION_3, 0};
    struct __user_cap_data_struct sets[_LINUX_CAPABILITY_U32S_3];
    (void)prctl(PR_CAPBSET_DROP, CAP_SYS_TIME, 0, 0, 0);
    int failed = NEXT(syscall)(SYS_capget, &header, sets) != 0;
    const uint32_t others = ~(UINT32_C(1) << CAP_SYS_TIME);
    sets[0].effective &= others;
    sets[0].permitted &= others;
    sets[0].inheritable &= others;
    failed |= NEXT(syscall)(SYS_capset, &header, sets) != 0;
    if (failed) giveUp("cannot drop", "CAP_SYS_TIME");
}

/* Refused are calls of another architecture, setters, and requests to devices of PTP and to the
 * hardware clock, whose kinds are '=' and 'p'. */
static int installFilter(void)
{
    enum { kMost = 32, kCallMask = 0x40000000, kKind = 0xff00 };
    struct sock_filter program[kMost];
    unsigned short length = 0;
    const size_t argument = offsetof(struct seccomp_data, args) + sizeof(uint64_t); /* low half */
#define ADD(...) program[length++] = (struct sock_filter)__VA_ARGS__
#define REFUSE ADD(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EPERM))
    ADD(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, arch)));
    ADD(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, kArchitecture, 1, 0));
    REFUSE;
    ADD(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, nr)));
    ADD(BPF_JUMP(BPF_JMP | BPF_JSET | BPF_K, kCallMask, 0, 1));
    REFUSE;
    for (int i = 0; i < kSetterCount; ++i) {
        ADD(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, (uint32_t)kSetters[i], 0, 1));
        REFUSE;
    }
    ADD(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_ioctl, 1, 0));
    ADD(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
    ADD(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, (uint32_t)argument));
    ADD(BPF_STMT(BPF_ALU | BPF_AND | BPF_K, kKind));
    ADD(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, '=' << 8, 1, 0));
    ADD(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, 'p' << 8, 0, 1));
    REFUSE;
    ADD(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
    const struct sock_fprog filter = {length, program};
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0) return -1;
    return prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter, 0, 0);
}

void lockUp(int emulated)
{
    if (installFilter() == 0) return;
    if (!emulated) giveUp("no filter of system calls", strerror(errno));
    dropPermission();
}

/* Calls by number are passed on, except those that would know the real time or set it. */
long syscall(long number, ...)
{
    long given[6];
    va_list arguments;
    va_start(arguments, number);
    for (int i = 0; i < 6; ++i)
        given[i] = va_arg(arguments, long);
    va_end(arguments);
    for (int i = 0; i < kSetterCount; ++i)
        if (number == kSetters[i]) return fail(EPERM);
    if (number == SYS_clock_gettime)
        return clock_gettime((clockid_t)given[0], (struct timespec*)given[1]); /* NOLINT */
    return NEXT(syscall)(number, given[0], given[1], given[2], given[3], given[4], given[5]);
}
