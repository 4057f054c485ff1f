#pragma once

#include "loop/tStep.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

namespace dravikHost {

// The latest orders of a lock. A clock whose pairs fail to come runs better on their mean than on
// the last one, which has the noise of one pair in it; the law, which goes on from what is in
// force, needs it back when the next pair comes.
class tMeanOrders
{
public:
    void add(const tStep& step);
    void restart();

    // What to order when no pair has come by then; nothing if none is missing, or it is ordered.
    std::optional<double> orderFor(int64_t elapsedNs);

    // What to order before the next pair, if the mean is in force.
    //   gain  of the law for the last pair's error, 1/s
    std::optional<double> resume(double gain);

private:
    static constexpr size_t kOrders = 24;
    static constexpr size_t kLeast = 8;

    double meanPpb() const;

    std::array<double, kOrders> orders{};
    size_t count = 0;
    int64_t latestNs = 0;
    int64_t spacingNs = 0; // between the latest two
    double latestErrorNs = 0;
    bool inForce = false;
};

} // namespace dravikHost
