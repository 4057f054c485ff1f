// The nine exported functions: the frame that every call goes through.

#include "support/allocator.h"
#include "support/tFakeHost.h"

#include <cerrno>
#include <cstdlib>
#include <gtest/gtest.h>
#include <pthread.h>
#include <stdexcept>
#include <thread>

namespace {

bool mutexCreationFails = false;

constexpr uint64_t kSecond = 1000000000U;

void lockIn(tFakeHost& host)
{
    host.pair(1 * kSecond, 1 * kSecond);
    host.pair(2 * kSecond, 2 * kSecond);
    host.pair(3 * kSecond, 3 * kSecond);
    host.takeCalls();
}

// Another thread gets through: the lock is free. A lock left behind would hang the test.
void expectLockFree(tFakeHost& host)
{
    std::thread([&host] {
        uint64_t time = 0;
        zverr_Status status{0, 0, foreignReallocJson, nullptr};
        zvckmservo_getTime(&host.table, &time, &status);
        EXPECT_EQ(0, status.code);
    }).join();
}

} // namespace

// Stands in for the system's function (--wrap), which cannot be made to fail.
extern "C" int __real_pthread_mutex_init(pthread_mutex_t* mutex,
                                         const pthread_mutexattr_t* attributes);
extern "C" int __wrap_pthread_mutex_init(pthread_mutex_t* mutex,
                                         const pthread_mutexattr_t* attributes)
{
    int protocol = PTHREAD_PRIO_INHERIT;
    if (attributes != nullptr) pthread_mutexattr_getprotocol(attributes, &protocol);
    EXPECT_EQ(PTHREAD_PRIO_INHERIT, protocol);
    return mutexCreationFails ? ENOMEM : __real_pthread_mutex_init(mutex, attributes);
}

namespace {

TEST(Initialize, AsksForTheLimitsOnlyAndOverwritesTheHandle)
{
    tFakeHost host;
    host.initialize();
    EXPECT_EQ(0, host.code());
    EXPECT_EQ("max min", host.takeCalls());
    EXPECT_NE(nullptr, host.table.servoHandle);
    zvckmservo_finalize(&host.table);
    EXPECT_EQ(nullptr, host.table.servoHandle);
    zvckmservo_finalize(&host.table);
    EXPECT_EQ("", host.takeCalls()) << "the end of a servo leaves the clock alone";
    EXPECT_EQ(0, zvckmservo_isSeeded(nullptr));
}

TEST(Initialize, LeavesTheHandleAloneWhenItFails)
{
    int somethingElse = 0;
    for (const std::string failing : {"getMaxFrequencyOffset", "getMinFrequencyOffset", "mutex"}) {
        SCOPED_TRACE(failing);
        const long before = allocator::liveBlocks();
        {
            tFakeHost host;
            host.table.servoHandle = &somethingElse;
            host.failIn(failing);
            mutexCreationFails = failing == "mutex";
            host.initialize();
            EXPECT_EQ(mutexCreationFails ? -52003 : -77, host.code());
            EXPECT_EQ(
                mutexCreationFails
                    ? R"({"file":"zvplat/quarks/synchronization","line":655,"component":"dravik"})"
                    : R"({"clock":"broken"})",
                host.status.text());
            EXPECT_EQ(&somethingElse, host.table.servoHandle);
            mutexCreationFails = false;
            host.table.servoHandle = nullptr;
        }
        EXPECT_EQ(before, allocator::liveBlocks());
    }
}

TEST(Initialize, DuringAnUnwindingAMissingMutexIsReplaced)
{
    struct tAtUnwinding {
        ~tAtUnwinding() { host.initialize(); }
        tFakeHost& host;
    };
    tFakeHost host;
    mutexCreationFails = true;
    EXPECT_THROW(
        {
            const tAtUnwinding atUnwinding{host};
            throw 42;
        },
        int);
    mutexCreationFails = false;
    EXPECT_EQ(0, host.code()) << "no guard raises during an unwinding";
    lockIn(host);
    expectLockFree(host);
}

TEST(Boundary, ANegativeStatusStopsEveryCall)
{
    tFakeHost host;
    host.initialize();
    lockIn(host);
    for (const int32_t code : {-1, INT32_MIN}) {
        tHostStatus failed(code, R"({"first":"failure"})");
        uint64_t time = 7;
        char buffer[4] = "abc";
        void* const handle = host.table.servoHandle;
        zvckmservo_initialize(&host.table, &failed.record);
        zvckmservo_clearHistory(&host.table, &failed.record);
        zvckmservo_adjustTime(&host.table, 4 * kSecond, 4 * kSecond, &failed.record);
        zvckmservo_getTime(&host.table, &time, &failed.record);
        EXPECT_EQ(1, zvckmservo_writeServoConfigJson(&host.table, R"({"phaseLockGain":2})",
                                                     &failed.record));
        EXPECT_EQ(1, zvckmservo_readServoConfigJson(&host.table, buffer, 3, &failed.record));
        zvckmservo_applyMetaData(&host.table, "{}", &failed.record);
        EXPECT_EQ(handle, host.table.servoHandle);
        EXPECT_EQ(7U, time);
        EXPECT_STREQ("abc", buffer);
        EXPECT_EQ(code, failed.code());
        EXPECT_EQ(R"({"first":"failure"})", failed.text());
        EXPECT_EQ("", host.takeCalls());
    }
    host.pair(4 * kSecond, 4 * kSecond + 100);
    EXPECT_EQ("get set -110", host.takeCalls()) << "still in phase lock, as it was";
}

TEST(Boundary, AWarningStopsNothingAndStays)
{
    tFakeHost host;
    tHostStatus warned(3, R"({"warning":1})");
    host.inOperation = [](const std::string&, zverr_Status* status) { status->code = 9; };
    host.timeNs = UINT64_MAX;
    uint64_t time = 0;
    zvckmservo_initialize(&host.table, &warned.record);
    for (const uint64_t t : {1, 2, 3, 4}) {
        if (t == 2) zvckmservo_clearHistory(&host.table, &warned.record);
        zvckmservo_adjustTime(&host.table, t, t, &warned.record);
    }
    EXPECT_EQ("max min get set 0", host.takeCalls());
    zvckmservo_getTime(&host.table, &time, &warned.record);
    EXPECT_EQ(UINT64_MAX, time);
    EXPECT_EQ(3, warned.code());
    EXPECT_EQ(R"({"warning":1})", warned.text());
    zvckmservo_applyMetaData(&host.table, "{", &warned.record);
    EXPECT_EQ(-52005, warned.code()) << "a failure replaces it";
}

TEST(Boundary, AnOperationThatThrowsArrivesWholeAndFreesTheLock)
{
    const char* const thrown69 =
        R"({"error_constant":"zvplaterr_softwareFaultPLATInternalUseOnly",)"
        R"("file":"zverr/tools/exception_errStatus","line":69,"component":"dravik",)"
        R"("std_exception_what":"broken"})";
    const char* const thrown74 =
        R"({"error_constant":"zvplaterr_softwareFaultPLATInternalUseOnly",)"
        R"("file":"zverr/tools/exception_errStatus","line":74,"component":"dravik"})";
    const struct {
        const char* operation;
        int thrown; // 1: a standard exception; 2: something else
        const char* text;
    } rows[] = {{"getTime", 1, thrown69}, {"getFrequency", 2, thrown74}, {"stepTime", 1, thrown69}};
    for (const auto& row : rows) {
        SCOPED_TRACE(testing::Message() << row.operation << " " << row.thrown);
        const long before = allocator::liveBlocks();
        {
            tFakeHost host;
            host.initialize();
            const bool stepping = row.operation == std::string("stepTime");
            if (stepping) {
                host.pair(1 * kSecond, 1 * kSecond);
                host.pair(2 * kSecond, 2 * kSecond);
            } else {
                lockIn(host);
            }
            host.inOperation = [&row](const std::string&, zverr_Status* status) {
                status->code = -5; // dropped: the exception is on its way
                if (row.thrown == 1) throw std::runtime_error("broken");
                throw 42;
            };
            uint64_t time = 7;
            host.status.reset();
            if (row.operation == std::string("getTime")) {
                zvckmservo_getTime(&host.table, &time, &host.status.record);
            } else {
                host.pair(4 * kSecond, 4 * kSecond + (stepping ? kSecond : 0));
            }
            EXPECT_EQ(-52003, host.code());
            EXPECT_EQ(row.text, host.status.text());
            EXPECT_EQ(7U, time);
            host.inOperation = nullptr;
            expectLockFree(host);
        }
        EXPECT_EQ(before, allocator::liveBlocks());
    }
}

} // namespace
