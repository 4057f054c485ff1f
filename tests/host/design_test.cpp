// Loops, filters and documents: against closed forms, and simulations of known noise.

#include "design/bandwidthDesign.h"
#include "design/designDocuments.h"
#include "design/estimateNoise.h"
#include "design/kalmanDesign.h"
#include "design/tLoopAnalysis.h"
#include "design/tTrial.h"
#include "host/stepFixture.h"
#include "maths/tNoise.h"

#include <complex>

using namespace dravikHost;

namespace {

tNoiseModel noiseOf(double interval, double noiseNs, double frequencyNoisePpb, double wanderPpb)
{
    return {std::llround(interval * 1e9), noiseNs, frequencyNoisePpb, wanderPpb, 0, 0};
}

// With the poles z of z^2 - sz + p: one per cent is reached after ln 0.01 / ln |z| pairs; damping
// is that of ln z; the noise that passes is the variance of x(n+1) = s x(n) - p x(n-1) - gT (A e(n)
// - B e(n-1)). The overshoots are worked out pair by pair.
TEST(LoopAnalysis, agreesWithClosedForms)
{
    const struct {
        const char* name;
        tServoParameters parameters;
        double interval;
        double damping, settling, overshoot, noiseGain;
    } kRows[] = {
        {"s = 1, p = 0.5", law(0.5, 2), 1, 0.40371275, 13.2877124, 0.5, 1.18321596},
        {"the same at half the interval", law(1, 2), 0.5, 0.40371275, 6.6438562, 0.5, 1.18321596},
        {"s = 1, p = 0.3", law(0.7, 10 / 7.0), 1, 0.81977928, 7.64995716, 0.3, 1.05441986},
        {"real poles", law(0.1, 1.01), 1, 1.62289299, 411.574568, 0.07048957, 0.24119122},
        {"deadbeat", law(1, 2), 1, 0, 2, 1, 2.23606798},
        {"alternating", law(0.6, 1.2), 2, 0, 43.1107870, 0.44, 1.49509000},
        {"one pole", law(0.5, 1, 0, 0), 1, 0, 6.6438562, 0, 0.57735027}};
    for (const auto& row : kRows) {
        const tLoopAnalysis found(row.parameters, row.interval);
        SCOPED_TRACE(row.name);
        EXPECT_TRUE(found.stable);
        EXPECT_NEAR(row.damping, found.damping.value_or(0), 1e-7);
        EXPECT_NEAR(row.settling, found.settling, 1e-6 * row.settling);
        EXPECT_NEAR(row.overshoot, found.overshoot, 1e-7);
        EXPECT_NEAR(row.noiseGain, found.noiseGain, 1e-7);
    }
}

TEST(LoopAnalysis, knowsWhereStabilityEnds)
{
    const struct {
        tServoParameters parameters;
        double below; // s; 0: none is told
        double stable, unstable;
        // clang-format off
    } kRows[] = {
        {law(0.55, 2), 80 / 33.0, 2.42, 2.43}, {law(0.1, 1.2, 0.8), 20, 19.9, 20.1},
        {law(1, 1, 1), 0, 0, 1 /* a double pole at 1 */}, {law(1, 0.5, 1), 0, 0, 0.001},
        {law(1, 2, -1), 0, 0, 0.001}, {law(1, -2, -3), 0, 0, 0.001},
        {law(1, 1, 0.5, 0.5), 0, 1.99, 2.01 /* where s = -1 - p */},
        {law(1, 0, -1, 0.5), 0, 0.49, 0.5 /* where p = 1 */}};
    // clang-format on
    for (const auto& row : kRows) {
        const tLoopAnalysis outside(row.parameters, row.unstable);
        EXPECT_FALSE(outside.stable) << row.unstable;
        EXPECT_NEAR(row.below, outside.stableBelow, 1e-12);
        EXPECT_EQ(0, outside.settling);
        EXPECT_EQ(row.stable > 0, tLoopAnalysis(row.parameters, row.stable).stable);
    }
    for (const auto& [interval, marginal] : {std::pair(1.0, true), {1.99, true}, {2, false}})
        EXPECT_EQ(marginal, tLoopAnalysis(law(1, 1), interval).marginal) << interval;
}

TEST(LoopGains, becomeALaw)
{
    tServoParameters parameters = law(1, 1, 1, 0);
    for (const auto& [gains, g, a, b] :
         {std::tuple<tLoopGains, double, double, double>{{0.7, 0.3}, 0.7, 1 / 0.7, 1},
          {{0.01, 0.99}, 0.1, 10, 0.1}, // A at its bound
          {{20, 5}, 10, 2.5, 2},        // the gain at its bound
          {{60, 40}, 10, 10, 6}}) {
        gains.putInto(parameters);
        EXPECT_DOUBLE_EQ(g, parameters.phaseLockGain);
        EXPECT_DOUBLE_EQ(a, parameters.phaseLockCoefficientA);
        EXPECT_DOUBLE_EQ(b, parameters.phaseLockCoefficientB);
        EXPECT_EQ(1, parameters.phaseLockCoefficientC);
        EXPECT_NEAR(gains.kp, tLoopGains::of(parameters).kp, 1e-12);
        EXPECT_NEAR(gains.ki, tLoopGains::of(parameters).ki, 1e-12);
    }
    EXPECT_TRUE((tLoopGains{60, 40}).fit());
    EXPECT_FALSE((tLoopGains{60, 40.1}).fit());
    EXPECT_THROW((tLoopGains{60, 40.1}).putInto(parameters), std::runtime_error);
}

// |H(Z)|^2 = |aZ - b|^2 / |Z^2 - (2 - a)Z + 1 - b|^2, a = (kp + ki) T, b = kp T, Z on the unit
// circle.
double powerAt(const tLoopGains& gains, double interval, double hertz)
{
    const double a = (gains.kp + gains.ki) * interval;
    const double b = gains.kp * interval;
    const auto z = std::polar(1.0, 2 * std::acos(-1.0) * hertz * interval);
    return std::norm((a * z - b) / (z * z - (2 - a) * z + (1 - b)));
}

TEST(BandwidthDesign, hasTheBandwidthAndNoMorePeaking)
{
    const struct {
        double bandwidth, peaking, interval, leastPeaking;
    } kRows[] = {{0.05, 0.1, 0.0625, 0.099},
                 {0.07, 1, 1, 0.99},
                 {0.05, 10, 0.125, 2},
                 {0.49, 0.01, 1, 0.0099}};
    for (const auto& row : kRows) {
        const tLoopGains found = gainsForBandwidth(row.bandwidth, row.peaking, row.interval);
        EXPECT_NEAR(0.5, powerAt(found, row.interval, row.bandwidth), 1e-9) << row.bandwidth;
        double most = 1;
        for (int i = 0; i < 1000; ++i) { // down to 4e-5 of half the rate of pairs
            const double hertz = 0.5 / row.interval * std::pow(0.99, i);
            most = std::max(most, powerAt(found, row.interval, hertz));
        }
        EXPECT_LE(10 * std::log10(most), row.peaking) << row.bandwidth;
        EXPECT_GE(10 * std::log10(most), row.leastPeaking) << row.bandwidth;
    }
    EXPECT_THROW(gainsForBandwidth(0.5, 0.1, 1), std::runtime_error);
    EXPECT_THROW(gainsForBandwidth(1e-6, 1e-3, 0.01), std::runtime_error);
}

// In the steady state, with a = K1 = kp T and b = K2 T = ki T, R the variance of a measurement and
// q that of the wander after 1 s, f that of the white frequency noise:
//     b^2 / (1 - a) = q T^3 / R        a^2 = b (2 - a) - b^2 / 6 + f T (1 - a) / R
TEST(Kalman, standsStillWhereTheoryHasIt)
{
    for (const tNoiseModel& model : {noiseOf(1, 50, 0, 1), noiseOf(0.125, 50, 3, 10),
                                     noiseOf(8, 5, 10, 1), noiseOf(1, 1000, 0.1, 0.5)}) {
        const double t = model.interval();
        const double r = model.noiseNs * model.noiseNs;
        const double q = model.wanderPpb * model.wanderPpb;
        const double f = model.frequencyNoisePpb * model.frequencyNoisePpb;
        const tKalmanDesign found = steadyKalman(model);
        const double a = found.gains.kp * t;
        const double b = found.gains.ki * t;
        EXPECT_NEAR(1, b * b / (1 - a) / (q * t * t * t / r), 1e-6);
        EXPECT_NEAR(a * a, b * (2 - a) - b * b / 6 + f * t * (1 - a) / r, 1e-6 * a * a);
        EXPECT_NEAR(std::sqrt(r * a / (1 - a)), found.rmsNs, 1e-6 * found.rmsNs);
    }
}

// A straight line through n points by least squares tells its end and its slope.
TEST(Kalman, growsLikeLeastSquares)
{
    for (const int n : {2, 3, 10}) {
        double squares = 0; // of the points' distances from their middle, m
        const double m = (n - 1) / 2.0;
        for (int i = 0; i < n; ++i)
            squares += (i - m) * (i - m);
        EXPECT_NEAR(1.0 / n + m * m / squares, growingKalman(n, 1).kp, 1e-12);
        EXPECT_NEAR(m / squares, growingKalman(n, 1).ki, 1e-12);
        EXPECT_DOUBLE_EQ(growingKalman(n, 1).kp / 4, growingKalman(n, 4).kp);
        EXPECT_DOUBLE_EQ(growingKalman(n, 1).ki / 4, growingKalman(n, 4).ki);
    }
}

// What a clock under corrections that vary, but are known, shows of such noise.
tRecording simulated(const tNoiseModel& model, int pairs)
{
    tNoise noise(1);
    tRecording recording{"trace", "", {}, 0, {}};
    const double t = model.interval();
    double phaseNs = 0;
    double frequencyPpb = 12e3;
    for (int i = 0; i < pairs; ++i) {
        const bool isOutlier = i % 100 < std::lround(model.outlierRate * 100);
        const double outlierNs = !isOutlier ? 0 : i / 100 % 2 == 0 ? 1 : -1;
        tRecordedPair pair{};
        pair.elapsedNs = i * model.intervalNs;
        pair.errorNs = phaseNs + model.noiseNs * noise.normal() + outlierNs * model.outlierSizeNs;
        pair.orderedPpb = i % 7 * 300 - 13e3;
        pair.stepNs = i % 50 == 0 ? -4000 : 0;
        recording.pairs.push_back(pair);
        phaseNs += static_cast<double>(pair.stepNs) + (frequencyPpb + *pair.orderedPpb) * t +
                   model.frequencyNoisePpb * std::sqrt(t) * noise.normal();
        frequencyPpb += model.wanderPpb * std::sqrt(t) * noise.normal();
    }
    return recording;
}

TEST(NoiseEstimate, findsWhatWasPutIn)
{
    const struct {
        tNoiseModel model;
        double frequencyWithin, wanderWithin;
    } kRows[] = {{{2'000'000'000, 50, 0, 1, 0, 0}, 5, 0.2},
                 {{1'000'000'000, 20, 20, 1, 0, 0}, 2, 0.3},
                 {{1'000'000'000, 50, 0, 1, 0.02, 3000}, 5, 0.25}};
    for (const auto& row : kRows) {
        const tNoiseEstimate found = estimateNoise(simulated(row.model, 5000));
        SCOPED_TRACE(testing::Message() << "row " << &row - kRows);
        EXPECT_EQ(row.model.intervalNs, found.intervalNs);
        EXPECT_NEAR(row.model.noiseNs, found.noiseNs, 2);
        EXPECT_NEAR(row.model.frequencyNoisePpb, found.frequencyNoisePpb, row.frequencyWithin);
        EXPECT_NEAR(row.model.wanderPpb, found.wanderPpb, row.wanderWithin);
        EXPECT_NEAR(row.model.outlierRate, found.outlierRate, 0.002);
        EXPECT_NEAR(row.model.outlierSizeNs, found.outlierSizeNs, 100);
    }
}

TEST(NoiseEstimate, needsEnoughToGoBy)
{
    tRecording recording = simulated(noiseOf(1, 50, 0, 1), 400);
    for (size_t i = 100; i < 400; ++i) // steps, not outliers
        recording.pairs[i].errorNs += i < 250 ? 5000 : -5000;
    EXPECT_EQ(0, estimateNoise(recording).outlierRate);
    EXPECT_NEAR(50, estimateNoise(recording).noiseNs, 5);
    recording.pairs.resize(100);
    EXPECT_NO_THROW(estimateNoise(recording));
    recording.pairs.resize(99);
    EXPECT_THROW(estimateNoise(recording), std::runtime_error);
    recording = simulated(noiseOf(1, 50, 0, 1), 100);
    recording.pairs[40].orderedPpb.reset();
    EXPECT_THROW(estimateNoise(recording), std::runtime_error);
}

TEST(Design, hasThresholdAndFilterAboveTheNoise)
{
    tNoiseModel model = noiseOf(2, 50, 0, 1);
    tServoParameters parameters;
    EXPECT_NEAR(600e-9, snapThresholdFor(model), 1e-15);
    setSpikeFilter(parameters, model); // mean steps of 2 / sqrt(pi) deviations in two seconds
    EXPECT_EQ(1, parameters.spikeFilterEnabled);
    EXPECT_EQ(4, parameters.spikeFilterHistorySize);
    EXPECT_EQ(4, parameters.spikeFilterGrowthFactor);
    EXPECT_NEAR(101.554e-9, parameters.spikeFilterMinThreshold, 1e-12);
    EXPECT_NEAR(677.028e-9, parameters.spikeFilterMaxThreshold, 1e-12);
    model.outlierRate = 0.01;
    model.outlierSizeNs = 1000;
    EXPECT_NEAR(1800e-9, snapThresholdFor(model), 1e-15);
    setSpikeFilter(parameters, model);
    EXPECT_EQ(1.7, parameters.spikeFilterGrowthFactor);
    EXPECT_EQ(1e-8, snapThresholdFor(noiseOf(1, 0, 0, 0))); // the bounds of documents
    setSpikeFilter(parameters, noiseOf(1, 0, 0, 0));
    EXPECT_EQ(1e-9, parameters.spikeFilterMinThreshold);
    EXPECT_EQ(1e-9, parameters.spikeFilterMaxThreshold);
}

// From 10 pairs, over which the frequency was measured, to the 264 of the quiet loop.
TEST(Design, getsQuietInSteps)
{
    tDesign design;
    tLoopGains{4 / 264.0, 1e-4}.putInto(design.quiet);
    design.quiet.snapTimeThreshold = 120e-6;
    addQuick(design, noiseOf(1, 10'000, 0.1, 1));
    EXPECT_EQ(10'000'000'000, design.measureOverNs);
    ASSERT_EQ(2U, design.quick.size());
    const tLoopGains quicker = tLoopGains::of(design.quick[0].parameters);
    EXPECT_NEAR(growingKalman(264 / 9.0, 1).kp, quicker.kp, 1e-12);
    EXPECT_NEAR(growingKalman(264 / 3.0, 1).ki, tLoopGains::of(design.quick[1].parameters).ki,
                1e-12);
    EXPECT_EQ(88'000'000'000, design.quick[0].heldNs);
    EXPECT_EQ(264'000'000'000, design.quick[1].heldNs);
    const double wrong = 3 * std::sqrt(2.0) * 10e-6 / 10; // of the frequency that was measured
    EXPECT_NEAR(120e-6 + wrong / 2 / std::sqrt(quicker.ki),
                design.quick[0].parameters.snapTimeThreshold, 1e-12);
    EXPECT_EQ(120e-6, design.quick[1].parameters.snapTimeThreshold);

    for (const auto& [interval, pairs, measured, documents] :
         {std::tuple(1.0, 11.9, 0.0, 0U), {0.5, 12.1, 1.0, 1U}, {28800.3, 264.0, 57600.6, 3U}}) {
        tDesign other;
        tLoopGains{4 / pairs / interval, 1e-9}.putInto(other.quiet);
        addQuick(other, noiseOf(interval, 50, 0, 1));
        EXPECT_EQ(std::llround(measured * 1e9), other.measureOverNs) << pairs;
        EXPECT_EQ(documents, other.quick.size()) << pairs;
    }
}

TEST(Trial, isLongEnoughForTheLoop)
{
    for (const auto& [ki, interval, settling, counted] : {std::tuple(1e-2, 1.0, 100, 2000),
                                                          {0.0025, 1, 200, 4000},
                                                          {1e-4, 4, 500, 10000},
                                                          {1, 1, 50, 2000},
                                                          {1e-6, 1, 2000, 10000}}) {
        const tTrialOptions options = trialFor({1, ki}, noiseOf(interval, 1, 1, 1));
        EXPECT_EQ(settling, options.settlingPairs) << ki;
        EXPECT_EQ(counted, options.countedPairs) << ki;
        EXPECT_EQ(32U, options.seeds);
    }
}

// The built-in law passes 124.62 % of the noise. Of normal errors the tail is 105^(1/8) deviations.
TEST(Trial, showsWhatTheLoopMakesOfNoise)
{
    const std::string builtIn = tServoParameters().documentText();
    const tTrialResult quiet = runTrial(library(), builtIn, noiseOf(1, 50, 0, 0), {100, 2000, 4});
    EXPECT_NEAR(62.3, quiet.rmsNs, 1.5);
    EXPECT_NEAR(62.3 * 1.789, quiet.tailNs, 9);
    EXPECT_GT(quiet.peakNs, 3 * quiet.rmsNs);
    EXPECT_LT(quiet.peakNs, 6 * quiet.rmsNs);
    EXPECT_EQ(0, quiet.lostPerHour);
    for (const double interval : {1.0, 0.5}) { // roughly, as errors in a row are not independent
        const std::string document = law(0.55 / interval, 2).documentText();
        const auto noisy =
            runTrial(library(), document, noiseOf(interval, 500, 0, 0), {100, 2000, 4});
        EXPECT_NEAR(465 / interval, noisy.lostPerHour, 150 / interval);
    }
    EXPECT_THROW(runTrial(library(), "{", noiseOf(1, 50, 0, 0), {1, 1, 1}), std::runtime_error);
}

// On every machine, as documents quote such figures: of trials in ns (RMS, tail and peak) and locks
// lost per hour; of starts how many never lock and fail, locks lost early and late, and ns RMS.
TEST(Trial, isTheSameEverywhere)
{
    const tNoiseModel model{500'000'000, 200, 30, 20, 0.04, 2000, 7};
    const std::string document = law(1.1, 2).documentText();
    const tTrialResult held = runTrial(library(), document, model, {10, 301, 2});
    EXPECT_EQ("393.95 1289.9 2782.2 243.09",
              fmt::format("{:.5g} {:.5g} {:.5g} {:.5g}", held.rmsNs, held.tailNs, held.peakNs,
                          held.lostPerHour));
    for (const auto& [pairs, measureOverNs, figures] :
         {std::tuple(9, 0, "1 4 0 4 1065.4"), {15, 1'000'000'000, "0 4 4 8 536.92"}}) {
        const auto found = runStarts(library(), document, model, {pairs, 30, measureOverNs});
        EXPECT_EQ(figures, fmt::format("{} {} {} {} {:.5g}", found.neverLocked, found.failed,
                                       found.lostEarly, found.lostLate, found.rmsNs));
    }
}

} // namespace
