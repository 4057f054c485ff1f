#include "loop/tMeanOrders.h"

#include <algorithm>
#include <numeric>

namespace dravikHost {

void tMeanOrders::add(const tStep& step)
{
    if (!step.locked) {
        restart();
        return;
    }
    spacingNs = count > 0 ? step.pair.elapsedNs - latestNs : 0;
    latestNs = step.pair.elapsedNs;
    latestErrorNs = static_cast<double>(step.pair.errorNs());
    orders[count++ % kOrders] = step.inForcePpb;
}

void tMeanOrders::restart()
{
    count = 0;
    inForce = false;
}

std::optional<double> tMeanOrders::orderFor(int64_t elapsedNs)
{
    const bool isLate = 2 * (elapsedNs - latestNs) >= 3 * spacingNs;
    if (inForce || count < kLeast || !isLate) return std::nullopt;
    inForce = true;
    return meanPpb();
}

std::optional<double> tMeanOrders::resume(double gain)
{
    if (!inForce) return std::nullopt;
    inForce = false;
    return meanPpb() - gain * latestErrorNs;
}

double tMeanOrders::meanPpb() const
{
    const size_t known = std::min(count, kOrders);
    const auto end = orders.begin() + static_cast<std::ptrdiff_t>(known);
    return std::accumulate(orders.begin(), end, 0.0) / static_cast<double>(known);
}

} // namespace dravikHost
