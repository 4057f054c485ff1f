#include "clocks/tSoftClock.h"
#include "host/stepFixture.h"
#include "sources/iReference.h"
#include "sources/recordedSources.h"
#include "sources/tLiveSource.h"
#include "sources/tSamplePace.h"
#include "sources/tSimulatedSource.h"

#include <algorithm>
#include <csignal>
#include <cstring>
#include <sys/shm.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <system_error>
#include <vector>

using namespace dravikHost;

namespace {

constexpr int64_t kMs = 1'000'000;
constexpr uint64_t kClock = kStartNs + 5000; // when the raw clock shows 0, the machine's kStartNs

// The only time that passes in the tests of live sources.
uint64_t rawNow = 0;
uint64_t rawTime() { return rawNow; }

// The machine's clock is as even as the raw one; the disciplined clock has a rate of its own.
struct tFakeClock : tSoftClock {
    tFakeClock() : tSoftClock(0, 0, 0) {}
    tCrossReading crossRead() override
    {
        const auto ownNs = static_cast<int64_t>(static_cast<double>(rawNow) * rate);
        return {kStartNs + rawNow + static_cast<uint64_t>(jumpNs),
                kClock + static_cast<uint64_t>(ownNs), 0};
    }

    double rate = 1;
    int64_t jumpNs = 0; // that others made with the machine's clock
};

// Gives the sample that is there after some time.
struct tFakeReference : iReference {
    std::optional<tReferenceSample> next(int64_t atMostNs) override
    {
        waitNs = atMostNs;
        rawNow += static_cast<uint64_t>(passNs);
        if (clock != nullptr) clock->jumpNs += jumpNs;
        return sample;
    }
    int64_t unusable() const override { return 3; }

    tFakeClock* clock = nullptr;
    int64_t passNs = 0, jumpNs = 0, waitNs = 0;
    std::optional<tReferenceSample> sample;
};

class LiveSource : public testing::Test
{
protected:
    LiveSource()
    {
        rawNow = 0;
        reference.clock = &clock;
    }
    tLiveSource open(std::optional<int64_t> durationNs = std::nullopt, int64_t offsetNs = 0)
    {
        return {clock, reference, signals, {offsetNs, durationNs, rawTime}};
    }
    // A sample from so long after the raw clock's 0, which comes after a time.
    std::optional<tMoment> sampleOf(iPairSource& source, int64_t systemNs, int64_t passNs,
                                    int64_t jumpNs = 0)
    {
        reference.passNs = passNs;
        reference.jumpNs = jumpNs;
        reference.sample = {kStartNs + static_cast<uint64_t>(systemNs), kClock, false};
        return source.next();
    }

    tFakeClock clock;
    tFakeReference reference;
    tSignals signals;
};

TEST_F(LiveSource, readsTheClockAtTheMomentOfTheSample)
{
    const struct {
        const char* name;
        int64_t passNs, atNs; // since the clock was ordered something
        double rate;
        int64_t jumpNs;
        int64_t clockNs; // what the clock showed at that moment; -1: left out
    } kRows[] = {{"of now", 100 * kMs, 100 * kMs, 1, 0, 100 * kMs},
                 {"of a while ago", 100 * kMs, 60 * kMs, 1, 0, 60 * kMs},
                 {"by a fast clock", 100 * kMs, 60 * kMs, 1.5, 0, 90 * kMs},
                 {"by a clock that runs backwards", 100 * kMs, 60 * kMs, -0.5, 0, -30 * kMs},
                 {"at once", 0, 0, 1.5, 0, 0},
                 {"of the moment of the order", 100 * kMs, 0, 1, 0, 0},
                 {"from before the order", 100 * kMs, -1, 1, 0, -1},
                 {"from the future", 100 * kMs, 100 * kMs + 1, 1, 0, -1},
                 {"with a system clock just even", 100 * kMs, 50 * kMs, 1, 1'100'000, 49'455'984},
                 {"of before the start by it", 100 * kMs, 0, 1, 1'100'000, 0},
                 {"stepped forwards by others", 100 * kMs, 50 * kMs, 1, 1'100'001, -1},
                 {"stepped backwards by others", 100 * kMs, 50 * kMs, 1, -1'100'001, -1}};
    for (const auto& row : kRows) {
        SCOPED_TRACE(row.name);
        rawNow = 0;
        clock.rate = row.rate;
        clock.jumpNs = 0;
        tLiveSource source = open();
        const auto moment = sampleOf(source, row.atNs, row.passNs, row.jumpNs);
        ASSERT_EQ(row.clockNs != -1, moment->pair.has_value());
        EXPECT_EQ(moment->pair ? std::max<int64_t>(row.atNs - row.jumpNs, 0) : row.passNs,
                  moment->elapsedNs);
        if (!moment->pair) continue;
        EXPECT_EQ(moment->elapsedNs, moment->pair->elapsedNs);
        EXPECT_EQ(row.clockNs, static_cast<int64_t>(moment->pair->clockNs - kClock));
        EXPECT_EQ(kClock, moment->pair->referenceNs);
    }
}

TEST_F(LiveSource, looksAtTheClockAnewAfterAnOrderOrAStepByOthers)
{
    tLiveSource source = open();
    EXPECT_TRUE(sampleOf(source, 90 * kMs, 100 * kMs)->pair);
    EXPECT_FALSE(sampleOf(source, 99 * kMs, 100 * kMs)->pair); // before the order for the first
    EXPECT_TRUE(sampleOf(source, 150 * kMs, 100 * kMs)->pair); // since that order
    EXPECT_FALSE(sampleOf(source, 350 * kMs, 100 * kMs, 20 * kMs)->pair);
    EXPECT_FALSE(sampleOf(source, 410 * kMs, 0)->pair); // before the step was noticed
    EXPECT_TRUE(sampleOf(source, 430 * kMs, 100 * kMs)->pair);
    reference.sample.reset();
    EXPECT_FALSE(source.next()->pair);
    EXPECT_EQ("left out of the reference's samples: 3 out of date, 3 not usable", source.remarks());
}

TEST_F(LiveSource, placesPulsesOnTheNearestSecondAndAddsTheOffset)
{
    const struct {
        int64_t offsetNs;
        bool pulse;
        int64_t aheadNs, errorNs; // of the clock: by what the sample says, and as given
    } kRows[] = {{250, false, 7 * kSecondNs + 1000, 7 * kSecondNs + 750},
                 {-250, false, 1000, 1250},
                 {0, true, 7 * kSecondNs + 300 * kMs, 300 * kMs},
                 {0, true, 7 * kSecondNs + 700 * kMs, -300 * kMs},
                 {0, true, -7 * kSecondNs - 300 * kMs, -300 * kMs},
                 {1000, true, 2 * kSecondNs + 100 * kMs, 100 * kMs - 1000}};
    for (const auto& row : kRows) {
        tLiveSource source = open({}, row.offsetNs);
        reference.sample = {kStartNs, kClock - static_cast<uint64_t>(row.aheadNs), row.pulse};
        EXPECT_EQ(row.errorNs, source.next()->pair->errorNs());
    }
}

TEST_F(LiveSource, endsInTime)
{
    tLiveSource source = open(250 * kMs);
    for (const auto& [passMs, waitMs, ends] : {std::tuple<int64_t, int64_t, bool>{100, 100, false},
                                               {100, 100, false},
                                               {49, 50, false},
                                               {1, 1, true}}) {
        reference.passNs = passMs * kMs;
        EXPECT_EQ(ends, !source.next().has_value());
        EXPECT_EQ(waitMs * kMs, reference.waitNs);
    }
}

TEST(Signals, doAfterwardsWhatTheyDidBefore)
{
    const auto handlers = [] {
        std::vector<sighandler_t> found;
        for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
            struct sigaction now = {};
            sigaction(signal, nullptr, &now);
            found.push_back(now.sa_handler);
        }
        return found;
    };
    for (const int signal : {SIGINT, SIGTERM, SIGHUP}) // what earlier ones may have left
        (void)std::signal(signal, SIG_IGN);
    const auto before = handlers();
    {
        const tSignals meanwhile;
        EXPECT_NE(before, handlers());
    }
    EXPECT_EQ(before, handlers());
    for (const int signal : {SIGINT, SIGTERM, SIGHUP})
        (void)std::signal(signal, SIG_DFL);
}

TEST(ClockReference, isReadAtItsPaceAndSilentWhereItFails)
{
    rawNow = 1000;
    bool broken = false;
    const auto reference = clockReference(
        100,
        [&] {
            if (broken) throw std::system_error(EIO, std::generic_category());
            return tCrossReading{rawNow, rawNow + 5, 1};
        },
        rawTime);
    const struct {
        uint64_t rawNs;
        bool broken, sample;
    } kRows[] = {{1000, false, true},  {1099, false, false}, {1110, false, true},
                 {1199, false, false}, {1200, false, true},  {1300, true, false},
                 {1399, false, false}, {1400, false, true},  {1860, false, true},
                 {1999, false, false}, {2000, false, true}};
    for (const auto& row : kRows) {
        rawNow = row.rawNs;
        broken = row.broken;
        const auto sample = reference->next(0);
        ASSERT_EQ(row.sample, sample.has_value()) << row.rawNs;
        if (!sample) continue;
        EXPECT_EQ(rawNow, sample->systemNs);
        EXPECT_EQ(rawNow + 5, sample->referenceNs);
        EXPECT_FALSE(sample->pulse);
    }
    EXPECT_EQ(1, reference->unusable());
}

TEST(References, areOpenedByName)
{
    for (const char* const name : {"realtime", "phc:/dev/ptp0"})
        EXPECT_TRUE(isReferenceName(name) && isReadOnDemand(name)) << name;
    for (const char* const name : {"shm:0", "shm:255", "sock:/x"})
        EXPECT_TRUE(isReferenceName(name) && !isReadOnDemand(name)) << name;
    for (const char* const name : {"shm:256", "shm:-1", "shm:2x", "shm:", "sock:", "phc:", "soft"})
        EXPECT_FALSE(isReferenceName(name)) << name;
    EXPECT_THROW(openReference("phc:/dev/null", kSecondNs), std::system_error);
    const auto sample = openReference("realtime", kSecondNs)->next(0);
    EXPECT_EQ(sample->systemNs, sample->referenceNs);
}

// A segment as its producer fills it.
struct tSegment {
    explicit tSegment(bool wide) : wide(wide) {}

    void put(size_t offset, uint32_t value) { words[offset / 4] = value; }
    void putTimes(uint64_t reference, uint32_t referenceUs, uint32_t referenceNs, uint64_t system,
                  uint32_t systemUs, uint32_t systemNs)
    {
        const size_t seconds = wide ? 8 : 4;
        std::memcpy(&words[2], &reference, seconds);
        put(8 + seconds, referenceUs);
        std::memcpy(&words[wide ? 6 : 4], &system, seconds);
        put(wide ? 32 : 20, systemUs);
        put(wide ? 52 : 40, referenceNs);
        put(wide ? 56 : 44, systemNs);
    }
    void putLeap(uint32_t leap) { put(wide ? 36 : 24, leap); }

    bool wide;
    uint32_t words[24] = {};
};

TEST(Segment, isReadInBothSizes)
{
    const struct {
        const char* name;
        uint32_t mode, leap;
        uint64_t second;
        uint32_t us, ns;
        uint64_t timeNs; // 0: cannot be used
    } kRows[] = {
        {"nanoseconds too", 1, 0, 1'700'000'000, 123'456, 123'456'789, 1'700'000'000'123'456'789},
        {"older producer", 0, 0, 1'700'000'000, 123'456, 0, 1'700'000'000'123'456'000},
        {"nanoseconds of another time", 1, 2, 1'700'000'000, 123'456, 123'457'000,
         1'700'000'000'123'456'000},
        {"after 2038", 1, 1, 4'000'000'000, 0, 7, 4'000'000'000'000'000'007},
        {"last microsecond", 1, 0, 1, 999'999, 999'999'999, 1'999'999'999},
        {"too many microseconds", 1, 0, 1, 1'000'000, 0, 0},
        {"not synchronised", 1, 3, 1, 0, 0, 0},
        {"unknown mode", 2, 0, 1, 0, 0, 0},
        {"last second", 1, 0, 17'999'999'999, 0, 0, 17'999'999'999'000'000'000U},
        {"beyond it", 1, 0, 18'000'000'000, 0, 0, 0}};
    for (const bool wide : {false, true}) {
        for (const auto& row : kRows) {
            if (!wide && row.second > UINT32_MAX) continue;
            SCOPED_TRACE(row.name);
            tSegment segment(wide);
            segment.put(0, row.mode);
            segment.putLeap(row.leap);
            segment.putTimes(row.second, row.us, row.ns, row.second + 1, 500'000, 500'000'001);
            const auto word = [&](size_t offset) { return segment.words[offset / 4]; };
            const auto sample = sampleInSegment(word, wide);
            ASSERT_EQ(row.timeNs != 0, sample.has_value());
            if (!sample) continue;
            EXPECT_EQ(row.timeNs, sample->referenceNs);
            EXPECT_EQ((row.second + 1) * kSecondNs + 500'000'001, sample->systemNs);
            EXPECT_FALSE(sample->pulse);
        }
    }
}

// Whichever word the producer comes in at, a sample of mode 1 that it changed is not used.
TEST(Segment, isLeftWhereTheProducerIsAtWork)
{
    for (const auto& [wide, mode] : {std::pair(false, 0U), {false, 1U}, {true, 0U}, {true, 1U}}) {
        for (size_t disturbed = 8; disturbed < (wide ? 60U : 48U); disturbed += 4) {
            tSegment segment(wide);
            segment.put(0, mode);
            bool read = false;
            const auto word = [&, at = disturbed](size_t offset) {
                if (offset == at) read = ++segment.words[1] > 0;
                return segment.words[offset / 4];
            };
            const bool used = sampleInSegment(word, segment.wide).has_value();
            EXPECT_EQ(segment.words[0] == 0 || !read, used) << wide << mode << disturbed;
        }
    }
}

// Each size once more in memory that is shared, with a key of its own.
TEST(Segment, isTakenOnceAndMadeIfNobodyDid)
{
    const key_t firstKey = 0x64720000 + 256 * (getpid() % 256);
    for (const auto& [unit, mode, size, wide] : {std::tuple(0, 0600, 0, sizeof(time_t) > 4),
                                                 {1, 0600, 80, false},
                                                 {2, 0666, 0, sizeof(time_t) > 4},
                                                 {3, 0640, 96, true}}) {
        SCOPED_TRACE(unit);
        if (size > 0) (void)shmget(firstKey + unit, static_cast<size_t>(size), IPC_CREAT | mode);
        const auto reference = sharedMemoryReference(unit, firstKey);
        const int id = shmget(firstKey + unit, 0, 0);
        shmid_ds state{};
        ASSERT_EQ(0, shmctl(id, IPC_STAT, &state));
        EXPECT_EQ(static_cast<unsigned>(mode), state.shm_perm.mode & 0777U);
        EXPECT_EQ(wide ? 96U : 80U, state.shm_segsz);
        void* const shared = shmat(id, nullptr, 0);
        EXPECT_FALSE(reference->next(0));
        tSegment segment(wide);
        segment.putTimes(7, 0, 0, 9, 0, 0);
        for (const uint32_t leap : {0U, 3U}) {
            segment.putLeap(leap);
            segment.put(wide ? 48 : 36, 1);
            std::memcpy(shared, segment.words, wide ? 96 : 80);
            const auto sample = reference->next(0);
            EXPECT_EQ(leap == 0, sample.has_value());
            EXPECT_EQ(uint64_t{7} * kSecondNs,
                      sample.value_or(tReferenceSample{0, 7 * kSecondNs, false}).referenceNs);
            EXPECT_EQ(leap == 0 ? 0 : 1, reference->unusable());
            EXPECT_FALSE(reference->next(0));
        }
        shmdt(shared);
        shmctl(id, IPC_RMID, nullptr);
    }
    const int strange = shmget(firstKey, 50, IPC_CREAT | 0600);
    EXPECT_EQ("the shared memory segment of unit 0 has 50 bytes, neither 80 nor 96",
              failureOf([&] { sharedMemoryReference(0, firstKey); }));
    shmctl(strange, IPC_RMID, nullptr);
}

class Socket : public testing::Test
{
protected:
    Socket()
    {
        address.sun_family = AF_UNIX;
        file.path.copy(address.sun_path, sizeof address.sun_path - 1);
    }
    ~Socket() override { close(fd); }
    const sockaddr* generalAddress() const { return reinterpret_cast<const sockaddr*>(&address); }
    void send(const void* datagram, size_t size) const
    {
        ASSERT_EQ(static_cast<ssize_t>(size),
                  sendto(fd, datagram, size, 0, generalAddress(), sizeof address));
    }

    const tTestFile file{"socket"};
    const int fd = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    sockaddr_un address{};
};

TEST_F(Socket, takesDatagramsOfBothSizes)
{
    constexpr int64_t kNo = INT64_MAX;
    struct tRest {
        double offset;
        int32_t pulse, leap, unused, magic;
    };
    constexpr int32_t kMagic = 0x534f434b;
    const struct {
        const char* name;
        uint64_t second, us;
        tRest rest;
        int longer;             // than it should be
        int64_t offsetNs = kNo; // kNo: not usable
    } kRows[] = {{"later", 1'700'000'000, 250'000, {5e-3, 0, 0, 0, kMagic}, 0, 5 * kMs},
                 {"at a leap second", 4'000'000'000, 999'999, {-2.5e-9, 0, 2, 0, kMagic}, 0, -3},
                 {"pulse", 10, 0, {0.25, 1, 0, 0, kMagic}, 0, 250 * kMs},
                 {"largest offset", 10, 0, {9e9, 0, 0, 9, kMagic}, 0, 9'000'000'000 * kSecondNs},
                 {"beyond it", 10, 0, {9.1e9, 0, 0, 0, kMagic}, 0},
                 {"beyond it on the other side", 10, 0, {-9.1e9, 0, 0, 0, kMagic}, 0},
                 {"no number", 10, 0, {std::nan(""), 0, 0, 0, kMagic}, 0},
                 {"too many microseconds", 10, 1'000'000, {0, 0, 0, 0, kMagic}, 0},
                 {"last second", 18'000'000'000, 0, {0, 0, 0, 0, kMagic}, 0, 0},
                 {"after the last second", 18'000'000'001, 0, {0, 0, 0, 0, kMagic}, 0},
                 {"not synchronised", 10, 0, {0, 0, 3, 0, kMagic}, 0},
                 {"another kind", 10, 0, {0, 0, 0, 0, kMagic + 1}, 0},
                 {"too short", 10, 0, {0, 0, 0, 0, kMagic}, -1},
                 {"too long", 10, 0, {0, 0, 0, 0, kMagic}, 1}};
    const auto reference = socketReference(file.path);
    int64_t unusable = 0;
    for (const size_t part : {size_t{4}, size_t{8}}) {
        for (const auto& row : kRows) {
            if (part == 4 && row.second > UINT32_MAX) continue;
            SCOPED_TRACE(row.name);
            unsigned char datagram[48] = {};
            std::memcpy(datagram, &row.second, part);
            std::memcpy(datagram + part, &row.us, part);
            std::memcpy(datagram + 2 * part, &row.rest, sizeof row.rest);
            send(datagram, 2 * part + sizeof row.rest + static_cast<size_t>(row.longer));
            const auto sample = reference->next(0);
            EXPECT_EQ(unusable += row.offsetNs == kNo ? 1 : 0, reference->unusable());
            ASSERT_EQ(row.offsetNs != kNo, sample.has_value());
            if (!sample) continue;
            EXPECT_EQ(row.second * kSecondNs + row.us * 1000, sample->systemNs);
            EXPECT_EQ(row.offsetNs, static_cast<int64_t>(sample->referenceNs - sample->systemNs));
            EXPECT_EQ(row.rest.pulse != 0, sample->pulse);
        }
    }
    EXPECT_FALSE(reference->next(0));
    EXPECT_EQ(unusable, reference->unusable());
}

TEST_F(Socket, replacesOnlyWhatNobodyListensToAnyMore)
{
    {
        const auto first = socketReference(file.path);
        EXPECT_THROW(socketReference(file.path), std::system_error);
        send("x", 1); // still reaches the first
        EXPECT_FALSE(first->next(0));
        EXPECT_EQ(1, first->unusable());
    }
    EXPECT_NE(0, access(file.path.c_str(), F_OK)); // ends with its object
    const int left = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    ASSERT_EQ(0, bind(left, generalAddress(), sizeof address));
    close(left);
    EXPECT_NO_THROW(socketReference(file.path));
    writeText(file.path, ""); // an ordinary file is left alone
    EXPECT_THROW(socketReference(file.path), std::system_error);
    EXPECT_EQ(0, access(file.path.c_str(), F_OK));
    EXPECT_THROW(socketReference(std::string(200, 'x')), std::system_error);
}

tRecordedPair recorded(int64_t seconds, int64_t errorNs, double orderedPpb, int64_t stepNs = 0)
{
    const tPair pair = pairAt(static_cast<double>(seconds), errorNs);
    const auto error = static_cast<double>(errorNs);
    return {pair.elapsedNs, pair.referenceNs, pair.clockNs, error,
            error - 1,      orderedPpb,       stepNs,       {}};
}

// The oscillator alone gains 10 ns each second.
tRecording recording()
{
    tRecording made;
    made.pairs = {recorded(0, 100, 0, -50), recorded(2, 70, -5), recorded(3, 75, 20)};
    return made;
}

TEST(FreeRunningSource, takesTheRecordedCorrectionsOutAndPutsItsOwnIn)
{
    tRecording made = recording();
    made.pairs[2].referenceNs += 1000; // the reference was stepped
    for (const int32_t orderedPpb : {0, 7}) {
        tFreeRunningClock clock(made.pairs[0].clockNs, 1000);
        clock.setOffsetPpb(orderedPpb);
        tFreeRunningSource source(made, clock);
        for (const int64_t seconds : {0, 2, 3}) {
            const auto pair = source.next()->pair;
            const int64_t errorNs = 100 + (10 + orderedPpb) * seconds;
            EXPECT_EQ(seconds * kSecondNs, pair->elapsedNs);
            EXPECT_NEAR(errorNs, pair->errorNs(), 1);
            EXPECT_NEAR(errorNs - 1, *pair->trueErrorNs, 1e-3);
        }
        EXPECT_FALSE(source.next());
    }
    made.pairs[1].orderedPpb.reset();
    tFreeRunningClock clock(kStartNs, 1000);
    EXPECT_THROW(tFreeRunningSource(made, clock), std::runtime_error);
}

TEST(MeasurementError, isNoiseAndNowAndThenAnOutlier)
{
    tNoise noise(2);
    tMeasurementModel model;
    model.noiseNs = 5;
    model.outlierRate = 0.1;
    model.outlierSizeNs = 1000;
    double above = 0, below = 0, squares = 0;
    for (int i = 0; i < 20'000; ++i) {
        const double errorNs = measurementErrorNs(model, noise);
        (errorNs > 500    ? above
         : errorNs < -500 ? below
                          : squares) += std::fabs(errorNs) > 500 ? 1 : errorNs * errorNs;
    }
    EXPECT_NEAR(1000, above, 100);
    EXPECT_NEAR(1000, below, 100);
    EXPECT_NEAR(25, squares / 18'000, 1);
}

TEST(Sources, lookForASampleWhenItIsDue)
{
    tSamplePace pace;
    const int64_t ms = 1'000'000;
    for (const int64_t takenMs : {0, 1000, 2050, 3000, 4000}) {
        EXPECT_EQ(10 * ms, pace.napNs(takenMs * ms));
        pace.taken(takenMs * ms);
    }
    EXPECT_EQ(931 * ms, pace.napNs(4000 * ms)); // 950 is the shortest, and a fiftieth before
    EXPECT_EQ(10 * ms, pace.napNs(4925 * ms));
    EXPECT_EQ(10 * ms, pace.napNs(9000 * ms));
    for (int i = 1; i <= 4; ++i)
        pace.taken((4000 + 4 * i) * ms);
    EXPECT_EQ(4 * ms, pace.napNs(4016 * ms)); // never less often than they come
}

} // namespace
