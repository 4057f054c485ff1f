#pragma once

#include <array>
#include <cstddef>

namespace dravikHost {

// Measurements that are far from what was foreseen, and what may be behind them: a reference that
// has jumped and stays there, an oscillator that has jumped in frequency, or a noise that has
// grown. A burst of delays is none of these; it is waited out.
class tDoubtfulPairs
{
public:
    // A measurement: when, and by how much it is not what was foreseen.
    struct tPoint {
        double seconds;
        double innovationNs;
    };
    enum tFinding { kNothing, kJump, kNewFrequency, kNoise };
    struct tVerdict {
        tFinding finding = kNothing;
        double phaseNs = 0;      // by which the clock is elsewhere, now
        double frequencyPpb = 0; // by which it runs otherwise
        double frequencyVariance = 0;
        double noiseVariance = 0; // of the noise that there is now
    };

    void takeGood(const tPoint& point); // one that is as foreseen
    tVerdict takeDoubtful(const tPoint& point, double noiseVariance);
    bool any() const { return inRow > 0; }
    void forget();

private:
    static constexpr size_t kKept = 64;
    struct tEntry {
        tPoint point;
        bool doubtful;
    };

    void add(const tPoint& point, bool doubtful);
    const tEntry& latest(size_t back) const { return entries[(count - 1 - back) % kKept]; }
    size_t pointsOfJump() const;
    tVerdict level(size_t points, double noiseVariance) const;
    bool beginsAtLastGood(const tVerdict& verdict, double noiseVariance) const;
    tVerdict line(size_t points, double noiseVariance) const;
    tVerdict grownNoise() const;
    double scatter(size_t points) const;

    std::array<tEntry, kKept> entries{};
    size_t count = 0;       // ever added since it last forgot
    size_t inRow = 0;       // doubtful ones, at the end, all to the same side
    double goodSeconds = 0; // when the latest good one was
    double share = 0;       // of doubtful ones, lately
};

} // namespace dravikHost
