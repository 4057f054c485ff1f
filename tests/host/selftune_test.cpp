#include "clocks/tSteeredClock.h"
#include "host/stepFixture.h"
#include "loop/tDiscipline.h"
#include "maths/tNoise.h"
#include "selftune/tClockEstimate.h"

#include <functional>
#include <memory>

using namespace dravikHost;

namespace {

// A clock steered by what an estimate says, without a servo between.
struct tLoop {
    tClockEstimate estimate;
    tNoise noise{1};
    double seconds = 1; // from pair to pair
    double stepNs = 1;  // of timestamps
    int64_t nowNs = 0;
    double phaseNs = 0, frequencyPpb = 0, orderedPpb = 0;
    int64_t pairs = 0;

    // Lets a pair's time pass, and measures.
    tClockEstimate::tEvent pair(double noiseNs, double wanderPpb, double offNs = 0)
    {
        const double walk = wanderPpb * std::sqrt(seconds);
        phaseNs += (frequencyPpb + orderedPpb) * seconds;
        frequencyPpb += walk * noise.normal();
        nowNs += nsOfSeconds(seconds);
        const double measuredNs =
            std::round((phaseNs + noiseNs * noise.normal() + offNs) / stepNs) * stepNs;
        const auto event = estimate.take(nowNs, static_cast<int64_t>(measuredNs), nullptr);
        if (++pairs < 3) return event;
        const double by = -estimate.frequencyPpb() - estimate.phaseNs() / estimate.secondsPerPair();
        orderedPpb += by;
        estimate.steered(by);
        return event;
    }
    double rmsNs(int count, double noiseNs, double wanderPpb)
    {
        double squares = 0;
        for (int i = 0; i < count; ++i) {
            pair(noiseNs, wanderPpb);
            squares += phaseNs * phaseNs; // as it was measured: the order only takes effect
        }
        return std::sqrt(squares / count);
    }
};

// What is believed, the same on every machine: noise, wander, gain and error of the next pair.
std::string figuresOf(const tBelief& belief)
{
    return fmt::format("{:.7g} {:.7g} {:.7g} {:.7g}", belief.noiseNs, belief.wanderPpb, belief.gain,
                       belief.errorNs);
}

// The least errors that are possible are those of the filter that is told noise and wander.
struct tQuality {
    const char* name;
    double seconds, noiseNs, wanderPpb, leastNs;
    const char *early, *late; // what is believed after 30 pairs, and after 1000
};
const tQuality kQualities[] = {
    {"quiet", 1, 50, 1, 23.53, "52.23094 0.1811509 0.1279828 19.66824",
     "56.39875 1.434874 0.151248 24.23289"},
    {"loud", 1, 10'000, 1, 1193, "10010.73 14.92694 0.1278357 3766.288",
     "10922.43 2.166754 0.01742479 1457.03"},
    {"restless", 1, 50, 20, 60.12, "146.9228 29.82042 0.4394906 133.0015",
     "54.70447 26.83588 0.6286678 71.18436"},
    {"fast", 1.0 / 16, 15, 0.1, 1.81, "13.96932 1.460456 0.1278806 5.257026",
     "16.37244 0.2139083 0.01798276 2.219337"},
    {"fast, restless", 0.125, 50, 20, 22.74, "51.64187 3.703052 0.1279787 19.4456",
     "55.86514 22.38925 0.140893 22.76555"},
    {"slow", 16, 50, 1, 99.34, "155.1123 1.139752 0.5885808 187.821",
     "62.6541 0.9601793 0.753595 109.5615"}};

TEST(SelfTuning, findsTheBestGainsWithoutBeingToldTheNoise)
{
    for (const tQuality& row : kQualities) {
        SCOPED_TRACE(row.name);
        tLoop loop;
        loop.seconds = row.seconds;
        loop.frequencyPpb = 12'000;
        loop.phaseNs = 5000;
        loop.rmsNs(30, row.noiseNs, row.wanderPpb);
        EXPECT_EQ(row.early, figuresOf(loop.estimate.belief()));
        loop.rmsNs(970, row.noiseNs, row.wanderPpb);
        EXPECT_EQ(row.late, figuresOf(loop.estimate.belief()));
        EXPECT_NEAR(1, loop.rmsNs(20'000, row.noiseNs, row.wanderPpb) / row.leastNs, 0.12);
        const tBelief belief = loop.estimate.belief();
        EXPECT_NEAR(1, belief.noiseNs / row.noiseNs, 0.25);
        EXPECT_GT(1, std::fabs(std::log2(belief.wanderPpb / row.wanderPpb)));
        EXPECT_NEAR(1, belief.errorNs / row.leastNs, 0.35);
    }
}

// What pairs are taken for, a letter each, after a hundred with 20 ns of noise.
struct tEventRow {
    const char* name;
    std::function<double(int pair)> offNs; // of the measurements
    double frequencyPpb;                   // by which the oscillator changes
    const char* events;
    const char* figures; // what is believed afterwards
};
const tEventRow kEvents[] = {
    {"an outlier", [](int i) { return i == 1 ? -2000.0 : 0; }, 0, ".r......",
     "23.20392 0.1320085 0.09618365 7.638487"},
    {"a jump that stays", [](int) { return 10'000.0; }, 0, "rrrJ.....",
     "23.64363 0.1545712 0.1488934 9.408924"},
    {"a jump that ends", [](int i) { return i < 7 ? -10'000.0 : 0; }, 0, "rrrJ...B.....",
     "23.2924 0.1234717 0.1251127 8.583792"},
    {"two jumps that end", [](int i) { return i < 4   ? 3000.0
                                              : i < 9 ? 9000.0
                                                      : 0; }, 0,
     "rrrJrrrJ.B....", "22.81335 0.1346467 0.1748747 9.817673"},
    {"a noisy jump", [](int i) { return i % 2 == 0 ? 10'036.0 : 9'964; }, 0, "rrrrrrJ..",
     "24.41323 0.144483 0.2396876 12.2632"},
    {"a jump, back and beyond", [](int i) { return i < 5   ? 3000.0
                                                   : i < 8 ? 0
                                                           : -3000; }, 0,
     "rrrJ.B..rrrJ..", "22.70415 0.1141117 0.2604788 11.83011"},
    {"another frequency", [](int) { return 0.0; }, 2000, "rrrrF.....",
     "23.18531 0.1491471 0.3943876 18.16624"},
    {"a burst of delays", [](int i) { return i < 30 ? 3000.0 + 97 * ((i * i * 31) % 41) : 0; }, 0,
     "rrrrrrrrrrrrrrrrrrrrrrrrrrrrrr........", "23.17554 0.09578144 0.1473235 9.251523"},
    {"a louder noise", [](int i) { return i % 2 == 0 ? 700.0 + 31 * i : -900.0 - 17 * i; }, 0,
     "rrrrrN........", "1050.257 0.1209364 0.0001525658 13.58851"},
    {"a burst without an end", [](int i) { return 3000.0 + 97 * ((i * i * 31) % 41); }, 0, nullptr,
     "1776.488 0.3040912 0.002376913 87.72403"},
};

TEST(SelfTuning, knowsWhatUnforeseenPairsMean)
{
    for (const tEventRow& row : kEvents) {
        SCOPED_TRACE(row.name);
        tLoop loop;
        loop.rmsNs(100, 20, 0.1);
        loop.frequencyPpb += row.frequencyPpb;
        const std::string expected =
            row.events != nullptr ? row.events : std::string(99, 'r') + "N.....";
        std::string found;
        for (size_t i = 0; i < expected.size(); ++i)
            found += ".?rJBFNu"[loop.pair(20, 0.1, row.offNs(static_cast<int>(i)))];
        EXPECT_EQ(expected, found);
        EXPECT_EQ(row.figures, figuresOf(loop.estimate.belief()));
    }
}

TEST(SelfTuning, followsChangesOfNoiseAndWander)
{
    tLoop loop;
    loop.rmsNs(500, 50, 1);
    loop.rmsNs(50, 1000, 1);
    EXPECT_NEAR(1000, loop.estimate.belief().noiseNs, 300);
    loop.rmsNs(500, 1000, 1);
    loop.rmsNs(60, 50, 1);
    EXPECT_NEAR(50, loop.estimate.belief().noiseNs, 35);
    EXPECT_NEAR(23.5, loop.rmsNs(2000, 50, 1), 2.5);
    loop.rmsNs(100, 50, 20);
    EXPECT_NEAR(20, loop.estimate.belief().wanderPpb, 10);
    loop.rmsNs(200, 50, 1);
    EXPECT_GT(3, loop.estimate.belief().wanderPpb);
    EXPECT_EQ("48.75109 1.478827 0.2176213 25.716", figuresOf(loop.estimate.belief()));
}

// Timestamps tell no less noise than their steps make.
TEST(SelfTuning, knowsCoarseTimestamps)
{
    for (const auto& [stepNs, noiseNs, figures] :
         {std::tuple(1, 0.0, "0.2886751 0.000131781 0.06641283 0.07636126"),
          {100, 30, "33.39486 0.01660343 0.07129592 9.172587"},
          {100, 60, "70.47949 0.12808 0.08462928 21.29198"},
          {1000, 300, "333.9486 0.1660343 0.07129592 91.72587"}}) {
        tLoop loop;
        loop.stepNs = stepNs;
        loop.rmsNs(60, noiseNs, 0);
        EXPECT_EQ(figures, figuresOf(loop.estimate.belief())) << stepNs;
    }
}

// The servo of the plug-in, self-tuned, on a clock 20 ppm fast and 3 ms ahead.
struct tServoLoop {
    tSteeredClock clock{kStartNs + 3'000'000, 20'000, 100'000};
    tDisciplineOptions options;
    tNoise noise{7};
    tPair pair{0, kStartNs, 0, {}};
    double seconds = 1; // from pair to pair
    std::string events;
    tStep latest;
    std::unique_ptr<tDiscipline> discipline;

    tServoLoop()
    {
        options.selfTune = true;
        discipline = std::make_unique<tDiscipline>(library(), clock, options);
    }
    void pass(double seconds)
    {
        clock.pass(nsOfSeconds(seconds));
        pair.elapsedNs += nsOfSeconds(seconds);
        pair.referenceNs += static_cast<uint64_t>(nsOfSeconds(seconds));
    }
    double take(double offNs = 0)
    {
        const auto off = std::llround(30 * noise.normal() + offNs);
        pair.clockNs = clock.timeNs() + static_cast<uint64_t>(off);
        const double errorNs = clock.aheadOfNs(pair.referenceNs);
        latest = discipline->take(pair);
        if (latest.failure) std::rethrow_exception(latest.failure);
        events += latest.heldBack ? '-' : ".m!s0LxX"[latest.event];
        pass(seconds);
        return errorNs;
    }
    double rmsNs(int count)
    {
        double squares = 0;
        for (int i = 0; i < count; ++i) {
            const double errorNs = take();
            squares += errorNs * errorNs;
        }
        return std::sqrt(squares / count);
    }
};

TEST(SelfTuning, acquiresHoldsAndFollows)
{
    tServoLoop loop;
    loop.rmsNs(40);
    EXPECT_EQ(".msL" + std::string(36, '.'), loop.events);
    loop.rmsNs(200);
    EXPECT_GT(8, loop.rmsNs(300)); // 30 ns are measured; the oscillator is a perfect one
    ASSERT_TRUE(loop.latest.belief);
    EXPECT_NEAR(30, loop.latest.belief->noiseNs, 4);

    loop.events.clear();
    loop.take(5000);
    loop.rmsNs(4);
    loop.clock.step(10'000); // by somebody
    EXPECT_NEAR(10'000, loop.rmsNs(4), 20);
    EXPECT_GT(50, loop.rmsNs(4));
    EXPECT_EQ("-....---.....", loop.events);
    EXPECT_EQ(1, loop.latest.steps);

    loop.events.clear();
    loop.clock.step(-20'000'000); // which would take minutes at the highest rate
    loop.rmsNs(8);
    EXPECT_EQ("----....", loop.events);
    EXPECT_EQ(2, loop.latest.steps);
    EXPECT_EQ(0, loop.latest.locksLost);
    EXPECT_THROW(loop.discipline->retune(), std::runtime_error); // the built-in document ends locks
    loop.events.clear();
    loop.pass(-1); // the same moment again
    loop.rmsNs(3);
    EXPECT_EQ("-..", loop.events);
    EXPECT_GT(12, loop.rmsNs(300));
    EXPECT_EQ("30.52088 0.001602512 0.01286111 3.435286", figuresOf(*loop.latest.belief));
    const double rmsNs = loop.rmsNs(1);
    EXPECT_EQ("2.40845358 -19999.5625",
              fmt::format("{:.9g} {:.9g}", rmsNs, loop.clock.offsetPpb()));
}

TEST(SelfTuning, holdsAClockAThousandTimesASecond)
{
    tServoLoop loop;
    loop.seconds = 0.001; // no document has the gains that the first pairs ask for
    loop.rmsNs(1000);
    EXPECT_EQ(0, loop.latest.locksLost);
    EXPECT_GT(5, loop.rmsNs(3000));
}

TEST(SelfTuning, coastsAtTheEstimatedRate)
{
    tServoLoop loop;
    loop.rmsNs(100);
    loop.discipline->wait(loop.pair.elapsedNs); // the pair is due only now
    const double kicked = loop.clock.offsetPpb();
    loop.pass(0.5);
    loop.discipline->wait(loop.pair.elapsedNs);
    EXPECT_NE(kicked, loop.clock.offsetPpb());
    EXPECT_NEAR(-20'000, loop.clock.offsetPpb(), 1.5);
    const double coasting = loop.clock.offsetPpb();
    EXPECT_EQ("-20000.4375 -19999.6411", fmt::format("{:.9g} {:.9g}", kicked, coasting));
    loop.pass(300.5);
    loop.discipline->wait(loop.pair.elapsedNs);
    EXPECT_EQ(coasting, loop.clock.offsetPpb());
    EXPECT_GT(500, std::fabs(loop.take()));
    EXPECT_GT(100, std::fabs(loop.take()));
    EXPECT_EQ(std::string::npos, loop.events.find('X'));
    const double rmsNs = loop.rmsNs(5);
    EXPECT_EQ("8.05539341 -20008.2812",
              fmt::format("{:.9g} {:.9g}", rmsNs, loop.clock.offsetPpb()));
}

// Whatever it is given it throws nothing, and orders what a clock can do.
TEST(SelfTuning, survivesAnyPairs)
{
    for (uint64_t seed = 1; seed <= 40; ++seed) {
        SCOPED_TRACE(seed);
        tServoLoop loop;
        tNoise noise(seed);
        for (int i = 0; i < 300; ++i) {
            const double what = noise.uniform();
            double offNs = 0;
            if (what < 0.02) offNs = 0x1p62 * noise.normal() / 4;
            if (what > 0.9) offNs = 1e9 * noise.normal();
            if (what > 0.3 && what < 0.4) offNs = 1e5 * noise.normal();
            if (what > 0.5 && what < 0.55) loop.pass(-1);    // the same stamps again
            if (what > 0.55 && what < 0.56) loop.pass(-100); // back
            if (what > 0.6 && what < 0.61) loop.pass(1e6);
            if (what > 0.7 && what < 0.75) loop.discipline->wait(loop.pair.elapsedNs);
            loop.take(offNs);
            ASSERT_TRUE(std::fabs(loop.clock.offsetPpb()) <= 100'000);
            ASSERT_TRUE(std::isfinite(loop.latest.belief->errorNs));
        }
    }
}

} // namespace
