#pragma once

#include "selftune/tBelief.h"
#include "servo/tHostCall.h"
#include "servo/tLockObserver.h"
#include "sources/iPairSource.h"

#include <exception>
#include <optional>
#include <string>
#include <vector>

namespace dravikHost {

// What a servo made of one pair, and how its clock stands after it.
struct tStep {
    tPair pair{};
    bool heldBack = false; // the servo did not see it: for a longer measurement, or not believed
    bool dryRun = false;   // no order reaches the clock: steps and frequencies are only wishes
    tLeftOut leftOut;      // samples so far, of a live source
    tHostCalls calls;      // that the servo made
    std::exception_ptr failure; // of the servo; what stands below is of the pair before
    tLockEvent event = kNothingNew;
    bool locked = false;
    int64_t stepNs = 0;            // by which the clock was stepped
    double inForcePpb = 0;         // offset of the clock's rate from here on
    int64_t steps = 0;             // so far; in a dry run there are none
    int64_t locksLost = 0;         // so far
    std::optional<tBelief> belief; // of self-tuning
    std::string tuning;            // what became of the servo's tuning, in words; mostly ""
};

// The reference says nothing.
struct tSilence {
    int64_t elapsedNs = 0;
    std::optional<int64_t> holdoverNs{}; // since the last pair, once that is a holdover
    std::optional<double> errorNs{};     // by how far the clock may be off, one deviation; if known
    tLeftOut leftOut{};                  // samples so far
    tHostCalls calls{};                  // orders to let the clock run on by itself
};

// Somebody who watches a clock under discipline. Nobody asks a watcher what to do next.
class iStepObserver
{
public:
    virtual ~iStepObserver() = default;

    // Before the first pair: what is about to happen, in words, and the calls that made the servo.
    virtual void begin(const std::string& /*scenario*/, const tHostCalls& /*calls*/) {}
    virtual void see(const tStep& /*step*/) {}
    virtual void see(const tSilence& /*silence*/) {}
    virtual void note(int64_t /*elapsedNs*/, const std::string& /*text*/) {} // for people
    virtual void end(const std::string& /*remarks*/) {} // about the source; mostly ""
};

// All who watch one run, in the order in which they are shown things. They are borrowed.
class tObservers : public iStepObserver
{
public:
    tObservers(std::initializer_list<iStepObserver*> observers) : all(observers) {}

    void begin(const std::string& scenario, const tHostCalls& calls) override
    {
        for (iStepObserver* const each : all)
            each->begin(scenario, calls);
    }
    void see(const tStep& step) override
    {
        for (iStepObserver* const each : all)
            each->see(step);
    }
    void see(const tSilence& silence) override
    {
        for (iStepObserver* const each : all)
            each->see(silence);
    }
    void note(int64_t elapsedNs, const std::string& text) override
    {
        for (iStepObserver* const each : all)
            each->note(elapsedNs, text);
    }
    void end(const std::string& remarks) override
    {
        for (iStepObserver* const each : all)
            each->end(remarks);
    }

private:
    std::vector<iStepObserver*> all;
};

} // namespace dravikHost
