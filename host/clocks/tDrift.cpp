#include "clocks/tDrift.h"

#include "maths/sameBits.h"
#include "text/quantity.h"

#include <cmath>

namespace dravikHost {

namespace {

constexpr uint64_t kFlickerCause = 1;
constexpr double kTwoPi = 6.28318530717958647693;

} // namespace

tDrift::tDrift(uint64_t seed) : flicker(tNoise(seed, kFlickerCause)) {}

double tDrift::nextPpb(const tDriftModel& model, int64_t stretchNs)
{
    double meanPpb = flicker.withAllan(model.flickerPpb);
    const double rosePpb = model.rampPpb * secondsOf(stretchNs);
    meanPpb += rampedPpb + rosePpb / 2;
    rampedPpb += rosePpb;
    if (model.sinePeriodNs > 0) {
        const double passed =
            static_cast<double>(stretchNs) / static_cast<double>(model.sinePeriodNs);
        const double fell = cosineOfTurns(turns) - cosineOfTurns(turns + passed);
        meanPpb += model.sinePpb * fell / (kTwoPi * passed);
        turns += passed;
        turns -= std::floor(turns);
    }
    return meanPpb;
}

} // namespace dravikHost
