#pragma once

#include "clocks/tSteeredClock.h"
#include "sources/tMeasurementModel.h"

#include <string>
#include <string_view>
#include <vector>

namespace dravikHost {

// How oscillator and reference are from a time on, and what happens at that time.
struct tPhase {
    int64_t fromNs = 0;
    tOscillatorModel oscillator;
    tMeasurementModel measurement;
    int64_t stepNs = 0;      // of the clock; in the first phase how far it is ahead
    double frequencyPpb = 0; // by which the oscillator's frequency changes; at first its error
    int64_t jumpNs = 0;      // of the reference
    bool silent = false;     // no pairs
};

using tScenario = std::vector<tPhase>; // in the order of time; the first begins at 0

struct tScenarioStart {
    tPhase phase; // what the text does not name is as it is here
    bool keepsInterval = false;
};

// Reads statements, one a line; # begins a comment. Throws std::runtime_error with name and line.
//   clock KEY=VALUE...        reference KEY=VALUE...
//   at TIME clock KEY=VALUE...        at TIME reference KEY=VALUE...
//   at TIME jump TIME        at TIME silence        at TIME resume
tScenario parseScenario(std::string_view text, const std::string& name,
                        const tScenarioStart& start);

} // namespace dravikHost
