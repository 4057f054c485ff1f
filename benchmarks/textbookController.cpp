#include "textbookController.h"

#include <algorithm>

namespace {

constexpr double kProportionalGain = 0.7; // parts per billion per nanosecond, at one pair a second
constexpr double kIntegralGain = 0.3;
constexpr double kLimitPpb = 500000.0;

} // namespace

tTextbookController::tTextbookController(double intervalSeconds, double offsetPpb)
    : proportionalGain(kProportionalGain / intervalSeconds),
      integralGain(kIntegralGain / intervalSeconds), integral(offsetPpb)
{}

void tTextbookController::adjustTime(zvckmservo_HostTable* host, uint64_t referenceTime,
                                     uint64_t clockTime, zverr_Status* status)
{
    host->setFrequency(nextOffsetPpb(referenceTime, clockTime), status);
}

int32_t tTextbookController::nextOffsetPpb(uint64_t referenceTime, uint64_t clockTime)
{
    const double errorNs = static_cast<double>(static_cast<int64_t>(referenceTime - clockTime));
    integral = std::clamp(integral + integralGain * errorNs, -kLimitPpb, kLimitPpb);
    const double offset = proportionalGain * errorNs + integral;
    return static_cast<int32_t>(std::clamp(offset, -kLimitPpb, kLimitPpb));
}
