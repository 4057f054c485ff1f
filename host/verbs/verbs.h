#pragma once

#include "verbs/commandLine.h"

#include <stdexcept>

namespace dravikHost {

// What each word of the command line does; its options are in the file of that name.
std::function<void()> addCheck(tOptionSet& options);
std::function<void()> addDoctor(tOptionSet& options);
std::function<void()> addMetrics(tOptionSet& options);
std::function<void()> addPlot(tOptionSet& options);
std::function<void()> addReplay(tOptionSet& options);
std::function<void()> addRun(tOptionSet& options);
std::function<void()> addShow(tOptionSet& options);
std::function<void()> addSimulate(tOptionSet& options);
std::function<void()> addTune(tOptionSet& options);

// All went well, but what was found is not what was asked for. Ends the program with a status of
// its own.
class tLimitBroken : public std::runtime_error
{
    using std::runtime_error::runtime_error;
};

} // namespace dravikHost
