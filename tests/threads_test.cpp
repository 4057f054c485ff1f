// Four threads at once, on one servo and on servos of their own: every exported call but the two
// that make and end a servo. The thread sanitizer looks at all of it; without it, the clock notices
// operations that overlap, and the readers documents that are torn.

#include "support/hostParts.h"

#include <atomic>
#include <cstdio>
#include <gtest/gtest.h>
#include <string>
#include <thread>
#include <vector>

namespace {

constexpr int kThreads = 4;
constexpr int kRounds = 1000;
constexpr uint64_t kSecond = 1000000000;

// Nothing in it is protected but by the servo's lock.
struct tClock {
    zvckmservo_HostTable table = {};
    int32_t offsetPpb = 0;
    int inside = 0;
    int overlaps = 0;
    long operations = 0;
};

thread_local tClock* current = nullptr; // the operations carry no context

struct tOperation {
    tOperation()
    {
        if (current->inside++ != 0) ++current->overlaps;
        ++current->operations;
        std::this_thread::yield();
    }
    ~tOperation() { --current->inside; }
    tOperation(const tOperation&) = delete;
    tOperation& operator=(const tOperation&) = delete;
};

void getTime(uint64_t* timeNs, zverr_Status* /*status*/)
{
    const tOperation operation;
    *timeNs = static_cast<uint64_t>(current->operations);
}
void stepTime(int64_t /*deltaNs*/, zverr_Status* /*status*/) { const tOperation operation; }
void getFrequency(int32_t* offsetPpb, zverr_Status* /*status*/)
{
    const tOperation operation;
    *offsetPpb = current->offsetPpb;
}
void setFrequency(int32_t offsetPpb, zverr_Status* /*status*/)
{
    const tOperation operation;
    current->offsetPpb = offsetPpb;
}
int32_t highest(zverr_Status* /*status*/) { return 500000; }
int32_t lowest(zverr_Status* /*status*/) { return -500000; }

void open(tClock& clock)
{
    zverr_Status status{0, 0, noReallocJson, nullptr};
    clock.table = hostTable(getTime, stepTime, getFrequency, setFrequency, highest, lowest);
    zvckmservo_initialize(&clock.table, &status);
    ASSERT_EQ(0, status.code);
}

// Two values that are always written together are read together.
void expectWhole(const std::string& document)
{
    const auto valueOf = [&](const std::string& key) {
        const size_t at = document.find(key);
        if (at == std::string::npos) return "no " + key;
        return document.substr(at + key.size(), document.find(',', at) - at - key.size());
    };
    EXPECT_EQ(valueOf("\"phaseLockCoefficientA\":"), valueOf("\"phaseLockCoefficientC\":"));
}

void useAll(tClock& clock, std::atomic<uint64_t>& seconds, int thread)
{
    current = &clock;
    zvckmservo_HostTable* const table = &clock.table;
    zverr_Status status{0, 0, noReallocJson, nullptr};
    for (int round = 0; round < kRounds; ++round) {
        const uint64_t reference = ++seconds * kSecond;
        zvckmservo_adjustTime(table, reference, reference + static_cast<uint64_t>(round % 5 * 100),
                              &status);
        uint64_t time = 0;
        zvckmservo_getTime(table, &time, &status);
        EXPECT_EQ(0, zvckmservo_isSeeded(table));
        if (round % 10 == thread) {
            char text[128];
            (void)std::snprintf(text, sizeof text,
                                R"({"phaseLockCoefficientA":%d,"phaseLockCoefficientC":%d})",
                                1 + round % 9, 1 + round % 9);
            zvckmservo_writeServoConfigJson(table, text, &status);
            (void)std::snprintf(text, sizeof text,
                                R"({"selectedTRInstID":"x","TRs":{"x":{"type":"%d"}}})", round);
            zvckmservo_applyMetaData(table, text, &status);
        }
        if (round % 10 == 5) {
            char document[512] = {};
            zvckmservo_readServoConfigJson(table, document, sizeof document - 1, &status);
            expectWhole(document);
        }
        if (round % 50 == 10 * thread) zvckmservo_clearHistory(table, &status);
    }
    EXPECT_EQ(0, status.code);
}

TEST(Threads, EveryCallFromFourAtOnce)
{
    for (const size_t servos : {1U, 4U}) {
        std::vector<tClock> clocks(servos);
        std::vector<std::atomic<uint64_t>> seconds(servos);
        for (tClock& clock : clocks) {
            open(clock);
            zverr_Status status{0, 0, noReallocJson, nullptr};
            zvckmservo_writeServoConfigJson(
                &clock.table, R"({"phaseLockCoefficientA":1,"phaseLockCoefficientC":1})", &status);
        }
        std::vector<std::thread> threads;
        for (int i = 0; i < kThreads; ++i) {
            const size_t own = static_cast<size_t>(i) % servos;
            threads.emplace_back(
                [&clocks, &seconds, own, i] { useAll(clocks[own], seconds[own], i); });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
        for (tClock& clock : clocks) {
            EXPECT_EQ(0, clock.overlaps);
            EXPECT_GE(clock.operations, kRounds);
            zvckmservo_finalize(&clock.table);
        }
    }
}

} // namespace
