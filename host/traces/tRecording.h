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
    std::vector<tUnreadLine> firstUnread; // a few of them
};

// Reads a file, "-" being the standard input, whose format shows in its lines: CSV with a header,
// lines of ptp4l, phc2sys or ts2phc, or chrony's refclocks.log. A log of several sources needs the
// name of one. Throws std::runtime_error if the file cannot be read or has not one measurement.
tRecording readRecording(const std::string& path, const std::string& sourceName = "");

// What remains of a recording without its corrections.

// Throws std::runtime_error if the recording does not tell what frequency its clock was given.
void requireCorrections(const tRecording& recording);

// By how many ns the oscillator and the noise, without the corrections, changed the error from one
// measurement to another, a later one that follows it.
double ownErrorNs(const tRecordedPair& from, const tRecordedPair& to);

} // namespace dravikHost
