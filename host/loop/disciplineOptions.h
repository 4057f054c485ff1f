#pragma once

#include "loop/tLaterDocuments.h"
#include "servo/tuning.h"

#include <CLI/CLI.hpp>

#include <cstdint>
#include <string>
#include <vector>

// What every verb that disciplines a clock has.
struct tDisciplineOptions {
    int32_t maxFrequencyOffsetPpb = 0;
    int64_t measureOverNs = 0;
    std::vector<tLaterDocument> later; // in the order of their times
    std::string csv;                   // "": none; "-": stdout
    bool dryRun = false;               // no order reaches the clock
    tTuning tuning;
    std::string library;
};

void addDisciplineOptions(CLI::App& app, tDisciplineOptions& options);

// How wrong a clock that the program makes itself is at the start.
struct tInitialError {
    int64_t offsetNs = 0;
    double frequencyPpb = 0;

    std::string text() const; // "+1 ms and +12.000 ppm off"
};

void addInitialErrorOptions(CLI::App& app, tInitialError& error, const char* defaultOffset);
