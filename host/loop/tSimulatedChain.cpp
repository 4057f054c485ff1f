#include "loop/tSimulatedChain.h"

#include "text/quantity.h"

#include <fmt/format.h>

#include <cmath>

namespace dravikHost {

namespace {

tOscillatorModel oscillatorOf(const tPhase& first)
{
    tOscillatorModel oscillator = first.oscillator;
    oscillator.frequencyErrorPpb = first.frequencyPpb;
    return oscillator;
}

} // namespace

class tSimulatedChain::tHop
{
public:
    tHop(const tScenario& scenario, const tDisciplineOptions& options, uint64_t seed, tHop* before)
        : noise(seed),
          clock(tSimulatedSource::kStartNs + static_cast<uint64_t>(scenario.front().stepNs),
                oscillatorOf(scenario.front()), options.maxFrequencyOffsetPpb, noise, seed),
          source(clock, scenario, noise, seed, before != nullptr ? &before->clock : nullptr)
    {}

    std::optional<tMoment> next(int64_t countedFromNs)
    {
        const auto moment = source.next();
        if (!moment || !moment->pair || moment->elapsedNs < countedFromNs) return moment;
        ++counted;
        squares += *moment->pair->trueErrorNs * *moment->pair->trueErrorNs;
        return moment;
    }

    double rmsNs() const { return std::sqrt(squares / static_cast<double>(counted)); }

    tNoise noise;
    tSimulatedClock clock;
    tSimulatedSource source;
    std::optional<tDiscipline> discipline; // of all but the last

private:
    int64_t counted = 0;
    double squares = 0;
};

tSimulatedChain::tSimulatedChain(const tServoLibrary& library, const tScenario& scenario, int count,
                                 uint64_t seed, const tDisciplineOptions& options)
    : halfNs(scenario.front().measurement.durationNs / 2)
{
    constexpr int kSeedBits = 32; // few give longer ones
    for (int left = count - 1; left >= 0; --left) {
        const uint64_t seedOfHop = seed + (static_cast<uint64_t>(left) << kSeedBits);
        tHop* const before = hops.empty() ? nullptr : hops.back().get();
        hops.push_back(std::make_unique<tHop>(scenario, options, seedOfHop, before));
        tHop& hop = *hops.back();
        if (left > 0) hop.discipline.emplace(library, hop.clock, options);
    }
}

tSimulatedChain::~tSimulatedChain() = default;

iClock& tSimulatedChain::lastClock() { return hops.back()->clock; }

// Along the chain: what is ordered of a clock does not show in its time before the next pair, but a
// step does.
std::optional<tMoment> tSimulatedChain::next()
{
    std::optional<tMoment> moment;
    for (const auto& hop : hops) {
        moment = hop->next(halfNs);
        if (!moment || hop == hops.back()) break;
        if (!moment->pair) {
            hop->discipline->wait(moment->elapsedNs);
            continue;
        }
        const tStep step = hop->discipline->take(*moment->pair);
        if (step.failure) std::rethrow_exception(step.failure);
    }
    return moment;
}

std::string tSimulatedChain::remarks() const
{
    constexpr size_t kInLine = 6;
    if (hops.size() == 1) return "";
    std::string text = "hops        RMS ";
    for (size_t i = 0; i < hops.size(); ++i) {
        const bool breakLine = i > 0 && i % kInLine == 0;
        text += fmt::format("{}{}",
                            i == 0      ? ""
                            : breakLine ? ",\n            "
                                        : ", ",
                            durationText(hops[i]->rmsNs()));
    }
    return text + "\n            (of each clock against the true time, second half of the run)";
}

} // namespace dravikHost
