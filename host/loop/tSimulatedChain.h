#pragma once

#include "loop/tDiscipline.h"
#include "sources/tSimulatedSource.h"

#include <memory>
#include <vector>

namespace dravikHost {

// Simulated clocks in a row, each measured against the one before and the first against the true
// time. All have the same model and tuning, noise of their own, and are disciplined here but for
// the last one, whose pairs come out.
class tSimulatedChain : public iPairSource
{
public:
    // Library and options are borrowed. The noise of the last clock is that of the seed, so that a
    // chain of one is a simulation as any. Throws as tDiscipline does.
    tSimulatedChain(const tServoLibrary& library, const tScenario& scenario, int hops,
                    uint64_t seed, const tDisciplineOptions& options);

    ~tSimulatedChain() override;

    iClock& lastClock();

    std::optional<tMoment> next() override;

    // Of more clocks than one: the error of each in the second half of the time.
    std::string remarks() const override;

private:
    class tHop;

    int64_t halfNs;
    std::vector<std::unique_ptr<tHop>> hops; // along the chain
};

} // namespace dravikHost
