// What a pair and each exported call cost, beside what they are made of: the lock, the host's
// operations, and the arithmetic of a textbook controller, all measured in the same run.

#include "support/hostParts.h"
#include "support/tOpenServo.h"
#include "tMedianReporter.h"
#include "textbookController.h"
#include "zverr/errStatus.h"
#include "zvplat/quarks/synchronization.h"

#include <algorithm>
#include <benchmark/benchmark.h>
#include <cstdio>
#include <functional>
#include <iterator>
#include <pthread.h>
#include <string>
#include <vector>

// Counts the lock operations of a pair; the same for all that is measured.
static long lockCount = 0;

extern "C" int __real_pthread_mutex_lock(pthread_mutex_t* mutex);
extern "C" int __wrap_pthread_mutex_lock(pthread_mutex_t* mutex)
{
    ++lockCount;
    return __real_pthread_mutex_lock(mutex);
}

namespace {

constexpr uint64_t kSecond = 1000000000U;

int32_t clockOffsetPpb = 0;

// A host whose clock costs nothing but the calls.
class tBenchHost
{
public:
    tBenchHost()
    {
        clockOffsetPpb = 0;
        auto* const open = new tOpenServo(&table);
        config = &open->config();
        table.servoHandle = static_cast<zvckmDravik::tServo*>(open);
    }
    ~tBenchHost() { zvckmservo_finalize(&table); }
    tBenchHost(const tBenchHost&) = delete;
    tBenchHost& operator=(const tBenchHost&) = delete;

    // Pairs a second apart, the clock wandering a few nanoseconds around the reference.
    void pair()
    {
        now += kSecond;
        zvckmservo_adjustTime(&table, now, now + (now >> 30) % 16U, &status);
    }
    // A pair that is stepped in snap time, and loses a lock.
    void pairOneSecondOff()
    {
        now += kSecond;
        zvckmservo_adjustTime(&table, now, now + kSecond, &status);
    }
    void lock()
    {
        for (int i = 0; i < 3; ++i) {
            pair();
        }
    }

    zvckmservo_HostTable table =
        hostTable([](uint64_t* timeNs, zverr_Status*) { *timeNs = kSecond; },
                  [](int64_t deltaNs, zverr_Status*) { benchmark::DoNotOptimize(deltaNs); },
                  [](int32_t* ppb, zverr_Status*) { *ppb = clockOffsetPpb; },
                  [](int32_t ppb, zverr_Status*) { clockOffsetPpb = ppb; },
                  [](zverr_Status*) { return 500000; }, [](zverr_Status*) { return -500000; });
    zverr_Status status = zverr_emptyStatus();
    zvckmDravik::iServoConfig* config;
    uint64_t now = 0;
};

void lockFirst(benchmark::State& state)
{
    zvplat::tFixedStatus status;
    tMutex mutex(&status);
    for (auto _ : state) {
        mutex.lock();
        mutex.unlock();
    }
}

void lockReentered(benchmark::State& state)
{
    zvplat::tFixedStatus status;
    tMutex mutex(&status);
    const tMutexGuard outer(mutex);
    for (auto _ : state) {
        mutex.lock();
        mutex.unlock();
    }
}

void hostCalls(benchmark::State& state)
{
    tBenchHost host;
    const zvckmservo_HostTable* table = &host.table;
    int32_t ppb = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(table);
        table->getFrequency(&ppb, &host.status);
        table->setFrequency(ppb, &host.status);
    }
}

void textbookArithmetic(benchmark::State& state)
{
    tTextbookController controller;
    uint64_t now = 0;
    for (auto _ : state) {
        now += kSecond;
        benchmark::DoNotOptimize(controller.nextOffsetPpb(now, now + (now >> 30) % 16U));
    }
}

void textbookPair(benchmark::State& state)
{
    tBenchHost host;
    tTextbookController controller;
    for (auto _ : state) {
        host.now += kSecond;
        controller.adjustTime(&host.table, host.now, host.now + (host.now >> 30) % 16U,
                              &host.status);
    }
}

// A locked servo fed with pairs; the history full before the first one counts.
void phaseLock(benchmark::State& state, uint32_t historySize)
{
    tBenchHost host;
    if (historySize > 0) {
        host.config->setSpikeFilterEnabled(true);
        host.config->setSpikeFilterHistorySize(historySize);
    }
    host.lock();
    for (uint32_t i = 0; i < 2 * historySize; ++i) {
        host.pair();
    }
    const long locksBefore = lockCount;
    for (auto _ : state) {
        host.pair();
    }
    state.counters["locks"] = benchmark::Counter(static_cast<double>(lockCount - locksBefore),
                                                 benchmark::Counter::kAvgIterations);
}

// A round through the states from clearHistory on, `pairs` long; the difference of two rounds is
// one pair in the state that the longer one ends in.
void roundOf(benchmark::State& state, int pairs)
{
    tBenchHost host;
    for (auto _ : state) {
        zvckmservo_clearHistory(&host.table, &host.status);
        if (pairs > 0) host.pair();
        if (pairs > 1) host.pair();
        if (pairs > 2) host.pairOneSecondOff();
        if (pairs > 3) host.pairOneSecondOff();
    }
}

void exportedGetTime(benchmark::State& state)
{
    tBenchHost host;
    uint64_t time = 0;
    for (auto _ : state) {
        zvckmservo_getTime(&host.table, &time, &host.status);
    }
}

void exportedIsSeeded(benchmark::State& state)
{
    tBenchHost host;
    for (auto _ : state) {
        benchmark::DoNotOptimize(zvckmservo_isSeeded(&host.table));
    }
}

void exportedInitializeFinalize(benchmark::State& state)
{
    tBenchHost host;
    zvckmservo_HostTable table = host.table;
    for (auto _ : state) {
        zvckmservo_initialize(&table, &host.status);
        zvckmservo_finalize(&table);
    }
}

// A refused text is the longest road there is: exception, bridge, status.
void exportedRefusedDocument(benchmark::State& state)
{
    tBenchHost host;
    for (auto _ : state) {
        zverr_Status status = zverr_emptyStatus();
        zvckmservo_writeServoConfigJson(&host.table, "", &status);
        zverr_releaseJson(&status);
    }
}

struct tEntry {
    const char* name;
    std::function<void(benchmark::State&)> run;
};

const tEntry kEntries[] = {
    {"mutex, first lock", lockFirst},
    {"mutex, re-entered", lockReentered},
    {"two host calls", hostCalls},
    {"textbook arithmetic", textbookArithmetic},
    {"textbook pair", textbookPair},
    {"phase lock, filter off", [](benchmark::State& state) { phaseLock(state, 0); }},
    {"phase lock, history 5", [](benchmark::State& state) { phaseLock(state, 5); }},
    {"phase lock, history 100", [](benchmark::State& state) { phaseLock(state, 100); }},
    {"clearHistory", [](benchmark::State& state) { roundOf(state, 0); }},
    {"clearHistory + 1 pair", [](benchmark::State& state) { roundOf(state, 1); }},
    {"clearHistory + 2 pairs", [](benchmark::State& state) { roundOf(state, 2); }},
    {"clearHistory + 3 pairs", [](benchmark::State& state) { roundOf(state, 3); }},
    {"clearHistory + 4 pairs", [](benchmark::State& state) { roundOf(state, 4); }},
    {"getTime", exportedGetTime},
    {"isSeeded", exportedIsSeeded},
    {"initialize + finalize", exportedInitializeFinalize},
    {"writeServoConfigJson, refused", exportedRefusedDocument},
};

void printRatios(const tMedianReporter& results)
{
    const auto row = [&results](const char* name, double ns) {
        std::printf("%-34s %8.1f ns %7.2f x first lock %7.2f x textbook pair\n", name, ns,
                    ns / results.ns("mutex, first lock"), ns / results.ns("textbook pair"));
    };
    const auto step = [&](const char* name, const char* longer, const char* shorter) {
        row(name, results.ns(longer) - results.ns(shorter));
    };
    std::printf("\nRatios, one pair or call\n");
    for (const char* const name :
         {"phase lock, filter off", "phase lock, history 5", "phase lock, history 100"}) {
        row(name, results.ns(name));
    }
    step("frequency lock, first pair", "clearHistory + 1 pair", "clearHistory");
    step("frequency lock, second pair", "clearHistory + 2 pairs", "clearHistory + 1 pair");
    step("snap time, with a step", "clearHistory + 3 pairs", "clearHistory + 2 pairs");
    step("phase lock, lock lost", "clearHistory + 4 pairs", "clearHistory + 3 pairs");
    for (const char* const name : {"clearHistory", "getTime", "isSeeded", "initialize + finalize",
                                   "writeServoConfigJson, refused"}) {
        row(name, results.ns(name));
    }

    const double locks = results.counter("phase lock, filter off", "locks");
    const double locking =
        results.ns("mutex, first lock") + (locks - 1) * results.ns("mutex, re-entered");
    const double budget =
        locking + results.ns("two host calls") + 2 * results.ns("textbook arithmetic");
    std::printf("\nBudget of a locked pair: %.0f locks %.1f ns + host calls %.1f ns + twice the "
                "arithmetic %.1f ns = %.1f ns; measured %.1f ns, %.2f of it\n",
                locks, locking, results.ns("two host calls"), 2 * results.ns("textbook arithmetic"),
                budget, results.ns("phase lock, filter off"),
                results.ns("phase lock, filter off") / budget);
}

} // namespace

int main(int argc, char** argv)
{
    for (const tEntry& entry : kEntries) {
        benchmark::RegisterBenchmark(entry.name, entry.run);
    }
    // Repeated in random order, so that what else the machine does falls on all alike.
    std::vector<std::string> arguments = {argv[0], "--benchmark_repetitions=9",
                                          "--benchmark_min_time=0.05",
                                          "--benchmark_enable_random_interleaving=true"};
    arguments.insert(arguments.end(), argv + 1, argv + argc);
    std::vector<char*> pointers(arguments.size());
    std::transform(arguments.begin(), arguments.end(), pointers.begin(),
                   [](std::string& argument) { return argument.data(); });
    int count = static_cast<int>(pointers.size());
    benchmark::Initialize(&count, pointers.data());
    if (benchmark::ReportUnrecognizedArguments(count, pointers.data())) return 1;
    tMedianReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    if (reporter.size() == std::size(kEntries)) printRatios(reporter); // not after a filter
    return 0;
}
