#pragma once

#include <cstdint>
#include <random>

namespace dravikHost {

// Random numbers that are the same bits on every machine: of the standard library only what is
// fixed to the bit is used, so neither its distributions nor its logarithm.
class tNoise
{
public:
    explicit tNoise(uint64_t seed) : engine(seed) {}

    double uniform(); // 0 to below 1
    double normal();  // mean 0, standard deviation 1

private:
    std::mt19937_64 engine;
    double spare = 0;
    bool hasSpare = false;
};

} // namespace dravikHost
