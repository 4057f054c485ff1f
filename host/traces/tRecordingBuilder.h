#pragma once

#include "traces/tRecording.h"

#include <string>
#include <string_view>
#include <vector>

namespace dravikHost {

// Collects the measurements of one source out of a trace that may have several.
class tRecordingBuilder
{
public:
    // The name of the source, or any part of it; "" takes the only one that there is.
    explicit tRecordingBuilder(const std::string& wantedSource) : wanted(wantedSource) {}

    // The time may count from any moment. Returns why the measurement cannot be used, mostly "".
    std::string add(std::string_view source, tRecordedPair pair);

    void setUnread(int64_t lineNumber, const std::string& why);

    tRecordedPair* last() { return pairs.empty() ? nullptr : &pairs.back(); }
    std::vector<tRecordedPair>& all() { return pairs; }

    // Throws std::runtime_error if nothing was collected, or sources were mixed.
    tRecording finish(const std::string& name, const std::string& format);

private:
    bool isWanted(std::string_view source);
    bool matches(std::string_view source) const;

    std::string wanted;
    bool exact = false;               // there is a source of the very name
    std::vector<std::string> sources; // all that were met
    size_t latestSource = 0;
    std::vector<tRecordedPair> pairs;
    int64_t startNs = 0;
    int64_t unreadLines = 0;
    std::vector<tUnreadLine> firstUnread;
};

} // namespace dravikHost
