#pragma once

#include "traces/tRecording.h"

#include <CLI/CLI.hpp>

#include <string>

// The trace that a verb reads.
struct tTraceOptions {
    std::string file;
    std::string source; // which one in it; "": the only one
    bool freeRunning = false;
};

CLI::Option* addTraceOptions(CLI::App& app, tTraceOptions& options);

// Also for those that look at the clock behind the corrections.
void addFreeRunningOption(CLI::App& app, tTraceOptions& options);

// Reads it, and tells on stderr how many lines are no measurements.
tRecording readTrace(const tTraceOptions& options);
