// Everything that can fail, one point after the other: in the load and in each exported call, the
// nth allocation, all memory from there on, the nth host operation, the nth file operation, the
// creation of the mutex; until a round ends with nothing left to fail. After each: the host lives,
// nothing has leaked, no lock is held, code and payload are the documented ones, a document has
// been applied up to some key and no further, and the servo brings its clock onto the reference.
// Usage: faults_test LIBRARY, with the default documents in their place by the relocation library

#include "support/faults.h"
#include "support/hostParts.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <dlfcn.h>
#include <iterator>
#include <optional>
#include <pthread.h>
#include <set>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

namespace {

using faults::tKind;

constexpr const char* kKindNames[] = {"allocation", "exhaustion", "file", "mutex", "operation"};

int failures = 0;
std::string where;      // of the round at hand
bool toldPlace = false; // a failure named the line that found no memory for a document

void expect(bool good, const std::string& what)
{
    if (good) return;
    ++failures;
    std::printf("%s: %s\n", where.c_str(), what.c_str());
}

#define CALL(name)                                                                                 \
    decltype(zvckmservo_##name)* const name =                                                      \
        reinterpret_cast<decltype(zvckmservo_##name)*>(find("zvckmservo_" #name))
struct tLibrary {
    explicit tLibrary(const char* path) : handle(dlopen(path, RTLD_NOW | RTLD_LOCAL)) {}
    ~tLibrary()
    {
        if (handle != nullptr) dlclose(handle);
    }
    tLibrary(const tLibrary&) = delete;
    tLibrary& operator=(const tLibrary&) = delete;
    void* find(const char* name) const { return handle != nullptr ? dlsym(handle, name) : nullptr; }

    void* const handle;
    CALL(initialize);
    CALL(finalize);
    CALL(isSeeded);
    CALL(clearHistory);
    CALL(adjustTime);
    CALL(getTime);
    CALL(writeServoConfigJson);
    CALL(readServoConfigJson);
    CALL(applyMetaData);
};
#undef CALL

// The one clock, 30 ppm fast and 5 ms ahead at the start of a round.
uint64_t trueNs;
double aheadNs;
int32_t orderedPpb;

bool operationFails(zverr_Status* status)
{
    if (!faults::isDue(faults::kHostOperation)) return false;
    status->code = -77;
    const std::string_view payload = R"({"clock":1})";
    if (status->reallocJson(status, 16)) payload.copy(status->json, payload.size());
    return true;
}

void getTime(uint64_t* timeNs, zverr_Status* status)
{
    if (!operationFails(status)) *timeNs = trueNs + static_cast<uint64_t>(std::llround(aheadNs));
}
void stepTime(int64_t deltaNs, zverr_Status* status)
{
    if (!operationFails(status)) aheadNs += static_cast<double>(deltaNs);
}
void getFrequency(int32_t* offsetPpb, zverr_Status* status)
{
    if (!operationFails(status)) *offsetPpb = orderedPpb;
}
void setFrequency(int32_t offsetPpb, zverr_Status* status)
{
    if (!operationFails(status)) orderedPpb = offsetPpb;
}
int32_t highest(zverr_Status* status) { return operationFails(status) ? 0 : 500000; }
int32_t lowest(zverr_Status* status) { return operationFails(status) ? 0 : -500000; }

// A host with its clock and its servo.
struct tHost {
    explicit tHost(const tLibrary& library)
        : library(library),
          table(hostTable(::getTime, ::stepTime, ::getFrequency, ::setFrequency, highest, lowest))
    {
        trueNs = 1700000000000000000U;
        aheadNs = 5e6;
        orderedPpb = 0;
    }
    ~tHost()
    {
        library.finalize(&table);
        forget();
    }
    tHost(const tHost&) = delete;
    tHost& operator=(const tHost&) = delete;

    void forget()
    {
        if (status.json != nullptr) exactReallocJson(&status, 0);
        status.code = 0;
    }
    void initialize() { library.initialize(&table, &status); }
    void write(const char* document)
    {
        const int result = library.writeServoConfigJson(&table, document, &status);
        expect(result == (status.code < 0 ? 1 : 0), "wrong result");
    }
    void pair()
    {
        library.adjustTime(&table, trueNs, trueNs + static_cast<uint64_t>(std::llround(aheadNs)),
                           &status);
    }
    void pass()
    {
        trueNs += 1000000000U;
        aheadNs += 30000.0 + orderedPpb;
    }
    void read(char (&text)[1024])
    {
        const int result = library.readServoConfigJson(&table, text, sizeof text, &status);
        expect(result == (status.code < 0 ? 1 : 0), "wrong result");
    }
    std::string config()
    {
        char text[1024] = {};
        read(text);
        return text;
    }

    const tLibrary& library;
    zvckmservo_HostTable table;
    // The buffer comes from the same memory as everything else.
    zverr_Status status = {0, 0, exactReallocJson, nullptr};
};

// Eleven values, each other than its default, in the order in which they are applied.
constexpr const char* kDocument =
    R"({"frequencyLockGain":1.0000001,"phaseLockGain":0.5,"phaseLockCoefficientA":1.9,)"
    R"("phaseLockCoefficientB":0.9,"phaseLockCoefficientC":0.999999,"snapTimeThreshold":2e-06,)"
    R"("spikeFilterEnabled":1,"spikeFilterHistorySize":6,"spikeFilterMaxThreshold":0.9,)"
    R"("spikeFilterMinThreshold":2e-06,"spikeFilterGrowthFactor":3})";
constexpr const char* kRefused = R"({"phaseLockGain":0.5,"snapTimeThreshold":99})";
constexpr const char* kMetaData =
    R"({"selectedTRInstID":"a","TRs":{"a":{"type":"IEEE 802.1AS-2011 TAB"}}})";

template <int n> void pairsBefore(tHost& host)
{
    host.write(R"({"spikeFilterEnabled":1})");
    for (int i = 0; i < n; ++i) {
        host.pair();
        host.pass();
    }
}
char buffer[1024];

void nothing(tHost& /*host*/) {}
template <int n> void servoAndPairs(tHost& host)
{
    host.initialize();
    pairsBefore<n>(host);
}
void servoLosingLock(tHost& host)
{
    servoAndPairs<20>(host);
    host.write(R"({"spikeFilterEnabled":0})");
    aheadNs += 1e6;
}

constexpr int kSome = -1; // points to be reached: at least one

void initialize(tHost& host) { host.initialize(); }
void pair(tHost& host) { host.pair(); }
void clearHistory(tHost& host) { host.library.clearHistory(&host.table, &host.status); }
void readClock(tHost& host)
{
    uint64_t now = 0;
    host.library.getTime(&host.table, &now, &host.status);
}
void writeDocument(tHost& host) { host.write(kDocument); }
void writeRefused(tHost& host) { host.write(kRefused); }
void writeNoJson(tHost& host) { host.write("{"); }
void readDocument(tHost& host) { host.read(buffer); }
void tellType(tHost& host) { host.library.applyMetaData(&host.table, kMetaData, &host.status); }
void tellNoType(tHost& host)
{
    host.library.applyMetaData(&host.table, R"({"selectedTRInstID":1})", &host.status);
}
void isSeeded(tHost& host) { host.library.isSeeded(&host.table); }
void finalize(tHost& host) { host.library.finalize(&host.table); }

struct tCall {
    const char* name;
    void (*prepare)(tHost& host);
    void (*call)(tHost& host);
    int operations, files, mutexes; // points to be reached
    int32_t code;                   // without a fault
    std::set<int32_t> exhausted;    // the codes where memory fails; none: it needs no memory
};
// clang-format off
const tCall kCalls[] = {
    {"initialize",               nothing,           initialize,    2, 0,     1, 0, {-52000}},
    {"adjustTime: first of two", initialize,        pair,          0, 0,     0, 0, {}},
    {"adjustTime: frequency",    servoAndPairs<1>,  pair,          2, 0,     0, 0, {}},
    {"adjustTime: step",         servoAndPairs<2>,  pair,          1, 0,     0, 0, {}},
    {"adjustTime: history",      servoAndPairs<4>,  pair,          2, 0,     0, 0, {-52000}},
    {"adjustTime: locked",       servoAndPairs<20>, pair,          2, 0,     0, 0, {}},
    {"adjustTime: lock lost",    servoLosingLock,   pair,          0, 0,     0, 0, {}},
    {"clearHistory",             servoAndPairs<9>,  clearHistory,  0, 0,     0, 0, {}},
    {"getTime",                  initialize,        readClock,     1, 0,     0, 0, {}},
    {"writeServoConfigJson",     initialize,        writeDocument, 0, 0,     0, 0, {-52000, -52005}},
    {"  a value refused",        initialize,        writeRefused,  0, 0,     0, -52005, {-52000, -52005}},
    {"  no JSON",                initialize,        writeNoJson,   0, 0,     0, -52005, {-52000, -52005}},
    {"readServoConfigJson",      initialize,        readDocument,  0, 0,     0, 0, {-52000, -52003}},
    // A default document that cannot be opened is no failure.
    {"applyMetaData",            initialize,        tellType,      0, kSome, 0, 0, {-52000, -52005, 0}},
    {"  a wrong member",         initialize,        tellNoType,    0, 0,     0, -52004, {-52000, -52004, -52005}},
    {"isSeeded",                 initialize,        isSeeded,      0, 0,     0, 0, {}},
    {"finalize",                 initialize,        finalize,      0, 0,     0, 0, {}},
};
// clang-format on

// The documented form of a status: a buffer with its end mark, and an object in it that names the
// code.
void expectForm(const zverr_Status& status)
{
    if (status.json == nullptr) return expect(status.capacity == 0, "a capacity without buffer");
    const std::string text = status.json;
    expect(text.size() + 2 <= status.capacity && status.json[status.capacity - 1] == 'J',
           "buffer without its end mark");
    expect(text.front() == '{' && text.back() == '}', "payload is no object: " + text);
    toldPlace |= text.find(R"("file":"dravik/tJsonConfig","line":16,)") != std::string::npos;
    if (status.code == -52000 && text != "{}") {
        expect(text.find(R"({"error_constant":"zvplaterr_memoryFull")") == 0, text);
    }
}

void expectOutcome(const tCall& call, tKind kind, bool fired, const zverr_Status& status)
{
    const std::string text = status.json != nullptr ? status.json : "";
    const std::string found = std::to_string(status.code) + " " + text;
    expectForm(status);
    switch (fired ? kind : faults::kFile) {
    case faults::kAllocation:
    case faults::kExhaustion:
        expect(call.exhausted.count(status.code) == 1, "without memory: " + found);
        break;
    case faults::kHostOperation:
        expect(status.code == -77 && text == R"({"clock":1})", "host's failure: " + found);
        break;
    case faults::kMutex:
        expect(status.code == -52003 && text.find("zvplat/quarks/synchronization") != text.npos,
               "no mutex: " + found);
        break;
    case faults::kFile: // a default document that cannot be read is no failure, half of it is
        expect(status.code == call.code || (fired && status.code == -52005), found);
        break;
    }
}

std::vector<std::string> linesOf(const std::string& text)
{
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);)
        lines.push_back(line);
    return lines;
}

// The values are given out in the order in which a document is applied: first as many of the new
// ones as were applied, then old ones.
void expectPrefix(const std::string& before, const std::string& after, const std::string& complete)
{
    const auto found = linesOf(after);
    const auto newOnes = linesOf(complete);
    const auto behind =
        std::mismatch(found.begin(), found.end(), newOnes.begin(), newOnes.end()).first;
    const auto oldOnes = linesOf(before);
    const auto rest = std::distance(behind, found.end());
    expect(static_cast<size_t>(rest) <= oldOnes.size() &&
               std::equal(behind, found.end(), oldOnes.end() - rest),
           "applied with gaps: " + after);
}

// Another thread gets through.
void expectLockFree(tHost& host)
{
    const auto read = [](void* argument) -> void* {
        readClock(*static_cast<tHost*>(argument));
        return nullptr;
    };
    pthread_t other = 0;
    expect(pthread_create(&other, nullptr, read, &host) == 0, "no thread");
    timespec deadline = {};
    clock_gettime(CLOCK_REALTIME, &deadline);
    deadline.tv_sec += 10;
    if (pthread_timedjoin_np(other, nullptr, &deadline) == 0) return;
    std::printf("%s: a lock is held\n", where.c_str());
    std::_Exit(1);
}

void expectLocks(tHost& host)
{
    for (int i = 0; i < 60 && host.status.code == 0; ++i) {
        host.pair();
        host.pass();
    }
    expect(host.status.code == 0 && std::fabs(aheadNs) < 1000,
           "no lock afterwards: " + std::to_string(host.status.code) + ", " +
               std::to_string(aheadNs) + " ns");
}

struct tRound {
    bool fired;
    std::string config; // behind the call
};

tRound round(const tLibrary& library, const tCall& call, tKind kind, long n,
             const std::string& complete)
{
    tHost host(library);
    call.prepare(host);
    expect(host.status.code == 0, "the preparation failed");
    const bool hadServo = host.table.servoHandle != nullptr;
    const std::string before = hadServo ? host.config() : "";
    tRound result = {};
    {
        const faults::tFault fault(kind, n);
        call.call(host);
        result.fired = fault.fired();
    }
    expectOutcome(call, kind, result.fired, host.status);
    expect((host.table.servoHandle != nullptr) ==
               (hadServo ? call.call != finalize : !result.fired),
           "a servo more or less");
    host.forget();
    if (host.table.servoHandle == nullptr) host.initialize();
    expectLockFree(host);
    result.config = host.config();
    if (hadServo && !complete.empty()) expectPrefix(before, result.config, complete);
    expectLocks(host);
    return result;
}

// Loads, uses and closes the library.
bool loadRound(const char* path, tKind kind, long n)
{
    bool fired = false;
    {
        std::optional<tLibrary> library;
        {
            const faults::tFault fault(kind, n);
            library.emplace(path);
            fired = fault.fired();
        }
        if (library->handle != nullptr) {
            tHost host(*library);
            host.initialize();
            tellType(host);
            expectLocks(host);
        } else {
            const char* const reason = dlerror();
            expect(false, reason != nullptr ? reason : "not loaded");
        }
    }
    expect(dlopen(path, RTLD_NOW | RTLD_NOLOAD) == nullptr, "still loaded");
    return fired;
}

// Runs rounds until nothing is left to fail, and gives the number of those in which something did.
template <class Round> long sweep(const char* call, tKind kind, const Round& round)
{
    long n = 0;
    for (bool fired = true; fired;) {
        where = std::string(call) + ", " + kKindNames[kind] + " " + std::to_string(++n);
        const long before = faults::liveBlocks();
        fired = round(n);
        const long leaked = faults::liveBlocks() - before;
        expect(leaked == 0, std::to_string(leaked) + " blocks have leaked");
    }
    return n - 1;
}

void expectPoints(const char* call, const char* kind, int expected, long found)
{
    where = call;
    expect(expected == kSome ? found > 0 : found == expected,
           std::to_string(found) + " " + kind + " to fail");
}

} // namespace

int main(int argc, char** argv)
{
    if (argc != 2) return 2;
    (void)std::setvbuf(stdout, nullptr, _IOLBF, BUFSIZ);
    const char* const path = argv[1];
    std::printf("%-32s %12s %12s %12s %12s %12s\n", "points that failed", kKindNames[0],
                kKindNames[1], kKindNames[2], kKindNames[3], kKindNames[4]);

    loadRound(path, faults::kFile, 1000); // what is allocated only once is there
    std::printf("%-32s", "load");
    for (const tKind kind : {faults::kAllocation, faults::kExhaustion, faults::kFile}) {
        const long points = sweep("load", kind, [&](long n) { return loadRound(path, kind, n); });
        expectPoints("load", kKindNames[kind], kSome, points);
        std::printf(" %12ld", points);
    }
    std::printf("\n");

    const tLibrary library(path);
    for (const tCall& call : kCalls) {
        std::printf("%-32s", call.name);
        const std::string complete = round(library, call, faults::kFile, 1000, "").config;
        const int memory = call.exhausted.empty() ? 0 : kSome;
        const int expected[] = {memory, memory, call.files, call.mutexes, call.operations};
        for (const tKind kind : {faults::kAllocation, faults::kExhaustion, faults::kFile,
                                 faults::kMutex, faults::kHostOperation}) {
            const long points = sweep(call.name, kind, [&](long n) {
                return round(library, call, kind, n, complete).fired;
            });
            expectPoints(call.name, kKindNames[kind], expected[kind], points);
            std::printf(" %12ld", points);
        }
        std::printf("\n");
    }
    expect(toldPlace, "no memory for a document, and no word where");
    std::printf("%d failures\n", failures);
    return failures > 0 ? 1 : 0;
}
