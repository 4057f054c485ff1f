#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

namespace dravikHost {

// When to look for the next sample where nobody tells that one has come: seldom until shortly
// before it is due, by the shortest of the latest spacings, and often from then on.
class tSamplePace
{
public:
    void taken(int64_t nowNs)
    {
        if (takenNs != kNever) spacings[count++ % spacings.size()] = nowNs - takenNs;
        takenNs = nowNs;
    }

    // How long to nap before the next look.
    int64_t napNs(int64_t nowNs) const
    {
        constexpr int64_t kOftenNs = 10'000'000;
        if (count < spacings.size()) return kOftenNs;
        const int64_t spacingNs = *std::min_element(spacings.begin(), spacings.end());
        const int64_t earlyNs = std::max(kOftenNs / 2, spacingNs / 50);
        return std::max(takenNs + spacingNs - earlyNs - nowNs, std::min(kOftenNs, spacingNs));
    }

private:
    static constexpr int64_t kNever = INT64_MIN;

    int64_t takenNs = kNever;
    std::array<int64_t, 4> spacings{};
    size_t count = 0;
};

} // namespace dravikHost
