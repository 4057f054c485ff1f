#include "sources/iReference.h"
#include "sources/recordedSources.h"
#include "sources/tLiveSource.h"
#include "sources/tSimulatedSource.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <sys/shm.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <system_error>
#include <unistd.h>
#include <vector>

using namespace dravikHost;

namespace {

constexpr int64_t kMs = 1'000'000;
constexpr int64_t kSecond = 1'000'000'000;
constexpr uint64_t kSystem = 1'700'000'000'000'000'000; // when the raw clock shows 0
constexpr uint64_t kClock = kSystem + 5000;

// The only time that passes in the tests of live sources.
uint64_t rawNow = 0;
uint64_t rawTime() { return rawNow; }

// The machine's clock is as even as the raw one; the disciplined clock has a rate of its own.
class tFakeClock : public iLiveClock
{
public:
    tCrossReading crossRead() override
    {
        const double ownNs = static_cast<double>(rawNow) * rate;
        return {kSystem + rawNow + static_cast<uint64_t>(jumpNs),
                kClock + static_cast<uint64_t>(static_cast<int64_t>(ownNs)), 0};
    }
    uint64_t timeNs() override { return 0; }
    void step(int64_t /*deltaNs*/) override {}
    int32_t offsetPpb() override { return 0; }
    void setOffsetPpb(int32_t /*offsetPpb*/) override {}
    int32_t maxOffsetPpb() override { return 0; }
    int32_t minOffsetPpb() override { return 0; }

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

    // A sample from so long after the raw clock's 0, which comes after a time.
    std::optional<tLiveMoment> sampleOf(iLiveSource& source, int64_t systemNs, int64_t passNs,
                                        int64_t jumpNs = 0)
    {
        reference.passNs = passNs;
        reference.jumpNs = jumpNs;
        reference.sample = {kSystem + static_cast<uint64_t>(systemNs), kClock, false};
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
    } kRows[] = {
        {"of now", 100 * kMs, 100 * kMs, 1, 0, 100 * kMs},
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
        {"stepped backwards by others", 100 * kMs, 50 * kMs, 1, -1'100'001, -1},
    };
    for (const auto& row : kRows) {
        rawNow = 0;
        clock.rate = row.rate;
        clock.jumpNs = 0;
        tLiveSource source(clock, reference, signals, {0, std::nullopt, rawTime});
        const auto moment = sampleOf(source, row.atNs, row.passNs, row.jumpNs);
        ASSERT_TRUE(moment) << row.name;
        EXPECT_EQ(row.clockNs != -1, moment->pair.has_value()) << row.name;
        if (!moment->pair) {
            EXPECT_EQ(row.passNs, moment->elapsedNs) << row.name;
            EXPECT_EQ("left out of the reference's samples: 1 out of date, 3 not usable",
                      source.remarks());
            continue;
        }
        EXPECT_EQ(std::max<int64_t>(row.atNs - row.jumpNs, 0), moment->elapsedNs) << row.name;
        EXPECT_EQ(moment->elapsedNs, moment->pair->elapsedNs);
        EXPECT_EQ(row.clockNs, static_cast<int64_t>(moment->pair->clockNs - kClock)) << row.name;
        EXPECT_EQ(kClock, moment->pair->referenceNs) << row.name;
    }
}

TEST_F(LiveSource, looksAtTheClockAnewAfterAnOrderOrAStepByOthers)
{
    tLiveSource source(clock, reference, signals, {0, std::nullopt, rawTime});
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
        int64_t aheadNs; // of the clock, by what the sample says
        int64_t errorNs;
    } kRows[] = {
        {0, false, 7 * kSecond + 1, 7 * kSecond + 1},
        {250, false, 1000, 750},
        {-250, false, 1000, 1250},
        {0, true, 7 * kSecond + 300 * kMs, 300 * kMs},
        {0, true, 7 * kSecond + 700 * kMs, -300 * kMs},
        {0, true, -7 * kSecond - 300 * kMs, -300 * kMs},
        {1000, true, 2 * kSecond + 100 * kMs, 100 * kMs - 1000},
    };
    for (const auto& row : kRows) {
        tLiveSource source(clock, reference, signals, {row.offsetNs, std::nullopt, rawTime});
        reference.sample = {kSystem + rawNow, kClock + rawNow - static_cast<uint64_t>(row.aheadNs),
                            row.pulse};
        EXPECT_EQ(row.errorNs, source.next()->pair->errorNs());
    }
}

TEST_F(LiveSource, endsInTime)
{
    tLiveSource source(clock, reference, signals, {0, 250 * kMs, rawTime});
    reference.passNs = 100 * kMs;
    for (const int64_t waitMs : {100, 100}) {
        EXPECT_TRUE(source.next());
        EXPECT_EQ(waitMs * kMs, reference.waitNs);
    }
    reference.passNs = 49 * kMs;
    EXPECT_EQ(249 * kMs, source.next()->elapsedNs);
    EXPECT_EQ(50 * kMs, reference.waitNs);
    reference.passNs = kMs;
    EXPECT_FALSE(source.next());
    EXPECT_FALSE(source.next());
    EXPECT_EQ(0, reference.waitNs);
}

TEST_F(LiveSource, endsWithASignal)
{
    tLiveSource source(clock, reference, signals, {0, std::nullopt, rawTime});
    EXPECT_FALSE(signals.takeReload());
    raise(SIGHUP);
    EXPECT_TRUE(signals.takeReload());
    EXPECT_FALSE(signals.takeReload());
    EXPECT_TRUE(source.next());
    raise(SIGTERM);
    EXPECT_FALSE(source.next());
    EXPECT_TRUE(signals.stopRaised());
}

TEST(Signals, endTheProgramAgainAfterwards)
{
    {
        const tSignals meanwhile;
    }
    for (const int signal : {SIGINT, SIGTERM, SIGHUP}) {
        struct sigaction now = {};
        sigaction(signal, nullptr, &now);
        EXPECT_EQ(SIG_DFL, now.sa_handler) << signal;
    }
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
    } kRows[] = {
        {1000, false, true}, {1099, false, false}, {1110, false, true},  {1199, false, false},
        {1200, false, true}, {1300, true, false},  {1399, false, false}, {1400, false, true},
        {1860, false, true}, {1860, false, false}, {1999, false, false}, {2000, false, true},
    };
    for (const auto& row : kRows) {
        rawNow = row.rawNs;
        broken = row.broken;
        const auto sample = reference->next(0);
        EXPECT_EQ(row.sample, sample.has_value()) << row.rawNs;
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
    EXPECT_THROW(openReference("phc:/dev/null", kSecond), std::system_error);
    const auto sample = openReference("realtime", kSecond)->next(0);
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
    size_t validAt() const { return wide ? 48 : 36; }
    size_t size() const { return wide ? 96 : 80; }

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
        {"beyond it", 1, 0, 18'000'000'000, 0, 0, 0},
    };
    for (const bool wide : {false, true}) {
        for (const auto& row : kRows) {
            if (!wide && row.second > UINT32_MAX) continue;
            tSegment segment(wide);
            segment.put(0, row.mode);
            segment.putLeap(row.leap);
            segment.putTimes(row.second, row.us, row.ns, row.second + 1, 500'000, 500'000'001);
            const auto word = [&](size_t offset) { return segment.words[offset / 4]; };
            const auto sample = sampleInSegment(word, wide);
            EXPECT_EQ(row.timeNs != 0, sample.has_value()) << row.name;
            if (!sample) continue;
            EXPECT_EQ(row.timeNs, sample->referenceNs) << row.name;
            EXPECT_EQ((row.second + 1) * kSecond + 500'000'001, sample->systemNs) << row.name;
            EXPECT_FALSE(sample->pulse);
        }
    }
}

// Whichever word the producer comes in at, a sample of mode 1 that it changed is not used.
TEST(Segment, isLeftWhereTheProducerIsAtWork)
{
    for (const bool wide : {false, true}) {
        for (const uint32_t mode : {0U, 1U}) {
            for (size_t disturbed = 8; disturbed < (wide ? 60U : 48U); disturbed += 4) {
                tSegment segment(wide);
                segment.put(0, mode);
                bool read = false;
                const auto word = [&](size_t offset) {
                    if (offset == disturbed) {
                        ++segment.words[1];
                        read = true;
                    }
                    return segment.words[offset / 4];
                };
                const bool used = sampleInSegment(word, wide).has_value();
                EXPECT_EQ(mode == 0 || !read, used) << wide << mode << disturbed;
            }
        }
    }
}

class SharedMemory : public testing::Test
{
protected:
    // Far from the keys of those that are in use.
    const int firstKey = 0x44000000 + getpid() * 4;

    ~SharedMemory() override
    {
        for (int unit = 0; unit < 4; ++unit)
            shmctl(shmget(firstKey + unit, 0, 0), IPC_RMID, nullptr);
    }
    shmid_ds stateOf(int unit) const
    {
        shmid_ds state{};
        EXPECT_EQ(0, shmctl(shmget(firstKey + unit, 0, 0), IPC_STAT, &state)) << unit;
        return state;
    }
};

TEST_F(SharedMemory, isMadeForTheSameUserOrForAll)
{
    const unsigned kModes[] = {0600, 0600, 0666, 0666};
    for (int unit = 0; unit < 4; ++unit) {
        const auto reference = sharedMemoryReference(unit, firstKey);
        EXPECT_EQ(kModes[unit], stateOf(unit).shm_perm.mode & 0777U) << unit;
        EXPECT_EQ(sizeof(time_t) > 4 ? 96U : 80U, stateOf(unit).shm_segsz);
        EXPECT_FALSE(reference->next(0));
        EXPECT_EQ(0, reference->unusable());
    }
    EXPECT_EQ(0U, stateOf(2).shm_nattch);
}

TEST_F(SharedMemory, isTakenSampleBySample)
{
    for (const bool wide : {false, true}) {
        tSegment segment(wide);
        const int unit = wide ? 1 : 0;
        const int id = shmget(firstKey + unit, segment.size(), IPC_CREAT | 0600);
        auto* const bytes = static_cast<unsigned char*>(shmat(id, nullptr, 0));
        const auto reference = sharedMemoryReference(unit, firstKey);
        for (const uint32_t leap : {0U, 3U}) {
            segment.putTimes(5, 6, 6007, 8, 9, 9001);
            segment.putLeap(leap);
            segment.put(segment.validAt(), 1);
            std::memcpy(bytes, segment.words, segment.size());
            const auto sample = reference->next(0);
            EXPECT_EQ(leap == 0, sample.has_value());
            EXPECT_EQ(leap == 0 ? 0 : 1, reference->unusable());
            EXPECT_EQ(5'000'006'007U,
                      sample.value_or(tReferenceSample{0, 5'000'006'007, false}).referenceNs);
            EXPECT_EQ(0, bytes[segment.validAt()]); // taken
            EXPECT_FALSE(reference->next(0));
        }
        shmdt(bytes);
    }
    shmget(firstKey + 2, 88, IPC_CREAT | 0600);
    EXPECT_THROW(sharedMemoryReference(2, firstKey), std::runtime_error);
}

class Socket : public testing::Test
{
protected:
    ~Socket() override
    {
        close(fd);
        unlink(path.c_str());
    }
    sockaddr_un address() const
    {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        std::copy(path.begin(), path.end(), address.sun_path);
        return address;
    }
    void send(const void* datagram, size_t size) const
    {
        const sockaddr_un to = address();
        const auto* const general = reinterpret_cast<const sockaddr*>(&to);
        ASSERT_EQ(static_cast<ssize_t>(size), sendto(fd, datagram, size, 0, general, sizeof to));
    }

    const std::string path = testing::TempDir() + "dravik_sock." + std::to_string(getpid());
    const int fd = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
};

TEST_F(Socket, takesDatagramsOfBothSizes)
{
    struct tRest {
        double offset;
        int32_t pulse, leap, unused, magic;
    };
    constexpr int32_t kMagic = 0x534f434b;
    const struct {
        const char* name;
        uint64_t second, us;
        tRest rest;
        int longer; // than it should be
        bool usable;
        int64_t offsetNs;
    } kRows[] = {
        {"later", 1'700'000'000, 250'000, {5e-3, 0, 0, 0, kMagic}, 0, true, 5 * kMs},
        {"earlier, at a leap second",
         4'000'000'000,
         999'999,
         {-2.5e-9, 0, 2, 0, kMagic},
         0,
         true,
         -3},
        {"pulse", 10, 0, {0.25, 1, 0, 0, kMagic}, 0, true, 250 * kMs},
        {"largest offset", 10, 0, {9e9, 0, 0, 9, kMagic}, 0, true, 9'000'000'000 * kSecond},
        {"beyond it", 10, 0, {9.1e9, 0, 0, 0, kMagic}, 0, false, 0},
        {"beyond it on the other side", 10, 0, {-9.1e9, 0, 0, 0, kMagic}, 0, false, 0},
        {"no number", 10, 0, {std::nan(""), 0, 0, 0, kMagic}, 0, false, 0},
        {"too many microseconds", 10, 1'000'000, {0, 0, 0, 0, kMagic}, 0, false, 0},
        {"after the last second", 18'000'000'001, 0, {0, 0, 0, 0, kMagic}, 0, false, 0},
        {"not synchronised", 10, 0, {0, 0, 3, 0, kMagic}, 0, false, 0},
        {"another kind", 10, 0, {0, 0, 0, 0, kMagic + 1}, 0, false, 0},
        {"too short", 10, 0, {0, 0, 0, 0, kMagic}, -1, false, 0},
        {"too long", 10, 0, {0, 0, 0, 0, kMagic}, 1, false, 0},
    };
    const auto reference = socketReference(path);
    int64_t unusable = 0;
    for (const size_t part : {size_t{4}, size_t{8}}) {
        for (const auto& row : kRows) {
            if (part == 4 && row.second > UINT32_MAX) continue;
            unsigned char datagram[48] = {};
            std::memcpy(datagram, &row.second, part);
            std::memcpy(datagram + part, &row.us, part);
            std::memcpy(datagram + 2 * part, &row.rest, sizeof row.rest);
            send(datagram, 2 * part + sizeof row.rest + static_cast<size_t>(row.longer));
            const auto sample = reference->next(0);
            EXPECT_EQ(row.usable, sample.has_value()) << row.name;
            EXPECT_EQ(unusable += row.usable ? 0 : 1, reference->unusable()) << row.name;
            if (!sample) continue;
            EXPECT_EQ(row.second * kSecond + row.us * 1000, sample->systemNs) << row.name;
            EXPECT_EQ(row.offsetNs, static_cast<int64_t>(sample->referenceNs - sample->systemNs));
            EXPECT_EQ(row.rest.pulse != 0, sample->pulse) << row.name;
        }
    }
    EXPECT_FALSE(reference->next(0));
    EXPECT_EQ(unusable, reference->unusable());
}

TEST_F(Socket, replacesOnlyWhatNobodyListensToAnyMore)
{
    {
        const auto first = socketReference(path);
        EXPECT_THROW(socketReference(path), std::system_error);
        send("x", 1); // still reaches the first
        EXPECT_FALSE(first->next(0));
        EXPECT_EQ(1, first->unusable());
    }
    EXPECT_NE(0, access(path.c_str(), F_OK)); // ends with its object

    const sockaddr_un own = address();
    const int left = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    ASSERT_EQ(0, bind(left, reinterpret_cast<const sockaddr*>(&own), sizeof own));
    close(left);
    EXPECT_NO_THROW(socketReference(path));

    close(open(path.c_str(), O_CREAT | O_CLOEXEC, 0600)); // an ordinary file is left alone
    EXPECT_THROW(socketReference(path), std::system_error);
    EXPECT_EQ(0, access(path.c_str(), F_OK));
    EXPECT_THROW(socketReference("/no/folder/socket"), std::system_error);
    EXPECT_THROW(socketReference(std::string(200, 'x')), std::system_error);
}

tRecordedPair recorded(int64_t seconds, int64_t errorNs, double orderedPpb, int64_t stepNs = 0)
{
    const uint64_t referenceNs = kSystem + static_cast<uint64_t>(seconds * kSecond);
    return {seconds * kSecond,
            referenceNs,
            referenceNs + static_cast<uint64_t>(errorNs),
            static_cast<double>(errorNs),
            static_cast<double>(errorNs) - 1,
            orderedPpb,
            stepNs,
            {}};
}

// The oscillator alone gains 10 ns each second.
tRecording recording()
{
    tRecording made;
    made.pairs = {recorded(0, 100, 0, -50), recorded(2, 70, -5), recorded(3, 75, 20)};
    return made;
}

TEST(RecordedSource, givesThePairsAndTheClockAsTheyWere)
{
    tRecording made = recording();
    made.pairs[0].orderedPpb.reset();
    tRecordedClock clock(1000);
    clock.setOffsetPpb(7);
    tRecordedSource source(made, clock);
    const int32_t kOffsets[] = {7, 7, -5}; // in force until the pair
    for (size_t i = 0; i < 3; ++i) {
        const auto pair = source.next();
        EXPECT_EQ(made.pairs[i].elapsedNs, pair->elapsedNs);
        EXPECT_EQ(made.pairs[i].referenceNs, pair->referenceNs);
        EXPECT_EQ(made.pairs[i].clockNs, pair->clockNs);
        EXPECT_EQ(made.pairs[i].trueErrorNs, pair->trueErrorNs);
        EXPECT_EQ(pair->clockNs, clock.timeNs());
        EXPECT_EQ(kOffsets[i], clock.offsetPpb());
    }
    EXPECT_FALSE(source.next());
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
            const auto pair = source.next();
            const int64_t errorNs = 100 + (10 + orderedPpb) * seconds;
            EXPECT_EQ(seconds * kSecond, pair->elapsedNs);
            EXPECT_NEAR(errorNs, pair->errorNs(), 1);
            EXPECT_NEAR(errorNs - 1, *pair->trueErrorNs, 1e-3);
        }
        EXPECT_FALSE(source.next());
    }
    made.pairs[1].orderedPpb.reset();
    tFreeRunningClock clock(kSystem, 1000);
    EXPECT_THROW(tFreeRunningSource(made, clock), std::runtime_error);
}

TEST(SimulatedSource, seesThePairsThroughItsModel)
{
    tNoise noise(1);
    tNoise same(1);
    tSimulatedClock clock(tSimulatedSource::kStartNs, {150, 0, 0}, 0, noise);
    tMeasurementModel model;
    model.intervalNs = kSecond;
    model.durationNs = 3 * kSecond;
    model.noiseNs = 1000;
    model.granularityNs = 100;
    tSimulatedSource source(clock, model, noise);
    for (int64_t i = 0; i < 3; ++i) {
        const auto pair = source.next();
        EXPECT_EQ(i * kSecond, pair->elapsedNs);
        const uint64_t trueNs = tSimulatedSource::kStartNs + static_cast<uint64_t>(i * kSecond);
        EXPECT_EQ((trueNs + static_cast<uint64_t>(i * 150)) / 100 * 100, pair->clockNs);
        for (int taken = 0; i > 0 && taken < 2; ++taken) // by the clock
            same.normal();
        const auto errorNs = static_cast<int64_t>(std::floor(measurementErrorNs(model, same)));
        EXPECT_EQ((trueNs + static_cast<uint64_t>(errorNs)) / 100 * 100, pair->referenceNs);
        EXPECT_NEAR(i * 150.0, *pair->trueErrorNs, 1e-6);
    }
    EXPECT_FALSE(source.next());
}

TEST(MeasurementError, isNoiseAndNowAndThenAnOutlier)
{
    tNoise noise(2);
    tMeasurementModel model;
    model.noiseNs = 5;
    model.outlierRate = 0.1;
    model.outlierSizeNs = 1000;
    int above = 0;
    int below = 0;
    double squares = 0;
    for (int i = 0; i < 20'000; ++i) {
        const double errorNs = measurementErrorNs(model, noise);
        above += errorNs > 500 ? 1 : 0;
        below += errorNs < -500 ? 1 : 0;
        squares += std::fabs(errorNs) < 500 ? errorNs * errorNs : 0;
    }
    EXPECT_NEAR(1000, above, 100);
    EXPECT_NEAR(1000, below, 100);
    EXPECT_NEAR(25, squares / 18'000, 1);
}

} // namespace
