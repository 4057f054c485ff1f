#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace dravikHost {

// One measurement of a trace, and what was done to the clock because of it.
struct tRecordedPair {
    int64_t elapsedNs;    // since the first measurement
    uint64_t referenceNs; // of a format that gives differences only: made up, but in step
    uint64_t clockNs;
    double errorNs; // clock minus reference, fractions included where they were recorded
    std::optional<double> trueErrorNs;
    std::optional<double> orderedPpb; // the clock's offset of rate from here on
    int64_t stepNs = 0;               // by which it was stepped right after
    std::optional<bool> locked;
    bool beginsStretch = false; // time went back before it: nothing goes on from the one before
};

// What a daemon prints in place of many measurements.
struct tRecordedSummary {
    int64_t elapsedNs; // since the first one
    double rmsNs;
    double greatestNs; // without its sign
    bool beginsStretch = false;
};

// A line that is no measurement and nothing else that the format is known to have.
struct tUnreadLine {
    int64_t number; // the first is 1
    std::string why;
};

// A whole trace, in memory.
struct tRecording {
    std::string name;   // of the file
    std::string format; // in words
    std::vector<tRecordedPair> pairs;
    int64_t unreadLines = 0;
    std::vector<tUnreadLine> firstUnread;         // a few of them
    int64_t events = 0;                           // lines that tell something else
    std::string source = {};                      // "": without a name
    std::vector<tRecordedSummary> summaries = {}; // if there are no pairs
    std::vector<std::string> notes = {};          // what people should know of the reading
};

// How to read it, where the file does not say.
struct tReadOptions {
    std::string source;               // the name of one, or any part of it; "": the only one
    std::optional<double> intervalNs; // from line to line, of lines without a time
    std::optional<double> unitNs;     // of errors in columns; else seconds
    bool frequency = false;           // one column is fractional frequency, not phase
};

// Reads a file, "-" being the standard input, whose format shows in its lines. Throws
// std::runtime_error if the file cannot be read, is of a known kind that is no trace, has several
// sources of which none was chosen, or has not one measurement.
tRecording readRecording(const std::string& path, const tReadOptions& options = {});

// Leaves the longest stretch of time that never goes back.
void keepLongestStretch(tRecording& recording);

// What remains of a recording without its corrections.

// Throws std::runtime_error if the recording does not tell what frequency its clock was given.
void requireCorrections(const tRecording& recording);

// By how many ns the oscillator and the noise, without the corrections, changed the error from one
// measurement to another, a later one that follows it.
double ownErrorNs(const tRecordedPair& from, const tRecordedPair& to);

} // namespace dravikHost
