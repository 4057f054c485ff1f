#include "maths/tFlicker.h"

#include <cmath>

namespace dravikHost {

namespace {

constexpr double kRatio = 4;
constexpr double kStageVariance =
    1.386294361119890619;                       // ln 4 of each give 1/f between their corners
constexpr double kFastest = 1.4;                // levels the ends to 3 % of both deviations
constexpr double kAllan = 1.177410022515474691; // root of 2 ln 2
constexpr double kTime = 1.0605047332462108;    // root of ln(256/27) / 2

} // namespace

double tFlicker::next()
{
    double sum = 0;
    double pull = kFastest;
    for (double& stage : stages) {
        const double kept = 1 / (1 + pull);
        stage = kept * stage + std::sqrt((1 - kept * kept) * kStageVariance) * noise.normal();
        sum += stage;
        pull /= kRatio;
    }
    return sum;
}

double tFlicker::withAllan(double ppb) { return ppb == 0 ? 0 : next() * (ppb / kAllan); }
double tFlicker::withTime(double ns) { return ns == 0 ? 0 : next() * (ns / kTime); }

} // namespace dravikHost
