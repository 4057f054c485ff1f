#pragma once

#include <cstdint>
#include <random>

namespace dravikHost {

// Random numbers that are the same bits on every machine: of the standard library only what is
// fixed to the bit is used, so neither its distributions nor its logarithm.
class tNoise
{
public:
    // Each cause has numbers of its own.
    explicit tNoise(uint64_t seed, uint64_t cause = 0);

    double uniform();     // 0 to below 1
    double normal();      // mean 0, standard deviation 1
    double exponential(); // mean 1, not negative

private:
    std::mt19937_64 engine;
    double spare = 0;
    bool hasSpare = false;
};

} // namespace dravikHost
