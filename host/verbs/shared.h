#pragma once

#include "loop/tDiscipline.h"
#include "traces/tRecording.h"
#include "verbs/commandLine.h"

#include <cstdint>
#include <string>

namespace dravikHost {

// What several verbs share: options, and the run in time of its own making.

void addTuningOptions(tOptionSet& options, tTuning& tuning);
void addDisciplineOptions(tOptionSet& options, tDisciplineOptions& discipline);

// Those that say how the servo is tuned.
constexpr const char* kTuningOptions[] = {"--config", "--then", "--metadata", "--reference-type",
                                          "--measure-over"};

// What would have no effect, or two things say differently, is a mistake.
void requireOneTuning(const tOptionSet& options, const tDisciplineOptions& discipline);

// "self-tuned", "tuned by a.json" and the like.
std::string tuningText(const tDisciplineOptions& discipline);

// Clocks in a row: 1 to 50.
void addHopsOption(tOptionSet& options, int& hops, const char* help);

// Files that may both be the standard input, which has one text to give.
void requireOneInput(const tTuning& tuning);

// How wrong a clock that the program makes itself is at the start.
struct tInitialError {
    int64_t offsetNs = 0;
    double frequencyPpb = 0;

    std::string text() const; // "+1 ms and +12.000 ppm off"
};
void addInitialErrorOptions(tOptionSet& options, tInitialError& error, const char* defaultOffset);

// The trace that a verb reads.
struct tTraceOptions {
    std::string file;
    tReadOptions read;
    bool freeRunning = false;
};
tOption addTraceOptions(tOptionSet& options, tTraceOptions& trace);

// Also for those that look at the clock behind the corrections.
void addFreeRunningOption(tOptionSet& options, tTraceOptions& trace);

// Reads it whole, and says on stderr which lines are not read.
tRecording readWholeTrace(const tTraceOptions& options);

// For those who follow a clock from measurement to measurement: of a trace whose time goes back
// the longest stretch. Throws std::runtime_error if it has summaries only.
tRecording readTrace(const tTraceOptions& options);

// A discipline in simulated or recorded time, with those who watch it. All are borrowed.
void runInMadeTime(const tServoLibrary& library, iClock& clock, iPairSource& source,
                   const std::string& scenario, const tDisciplineOptions& options);

} // namespace dravikHost
