#pragma once

#include "traces/tRecording.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace dravikHost {

// Logs tell differences of time and moments of their own. Their references start here, so that no
// difference, however negative, takes a clock below zero.
constexpr uint64_t kMadeUpStartNs = 1'700'000'000'000'000'000;

// Thirty years, in nanoseconds still within 64 bits. A greater error is none.
constexpr double kMostErrorNs = 1e18;

// A pair of which only the error is known, and when it was, counted from the start.
tRecordedPair pairOf(int64_t momentNs, double errorNs, uint64_t startNs = kMadeUpStartNs);

// Collects the measurements of a trace, each source by itself.
class tRecordingBuilder
{
public:
    void beginLine(int64_t number) { line = number; }

    // The time may count from any moment. The process is the run of a program that told it, if the
    // line says: two at the same time are two sources, one after the other are the same one.
    // Returns why the measurement cannot be used, mostly "".
    std::string add(std::string_view source, const tRecordedPair& pair,
                    std::string_view process = "");
    std::string add(std::string_view source, const tRecordedSummary& summary,
                    std::string_view process = "");

    // What follows begins a new stretch, whatever its time.
    void restart() { ++generation; }

    void setUnread(int64_t lineNumber, const std::string& why);
    void addEvent() { ++events; }
    void addNote(const std::string& note) { notes.push_back(note); }

    int64_t measurements() const { return taken; }
    int64_t unread() const { return unreadLines; }

    int64_t lineNumber() const { return line; }

    // What the options say was needed, which they may be given for only then.
    void useInterval() { intervalUsed = true; }
    void useUnit() { unitUsed = true; }
    bool usesInterval() const { return intervalUsed; }
    bool usesUnit() const { return unitUsed; }

    // Of a trace with one source; null if nothing was added yet.
    tRecordedPair* last();
    std::vector<tRecordedPair>* pairs();

    // Throws std::runtime_error if nothing was collected, or several sources fit the name.
    tRecording finish(const std::string& name, const std::string& format,
                      const std::string& wanted);

private:
    // The measurements of one kind from one source, whose time never goes back but with a new
    // stretch. One measurement alone that lies in the past is late; two in turn are a restart.
    template <typename Measurement> struct tTrack {
        std::vector<Measurement> taken;
        int64_t firstNs{}; // of the log
        int64_t shiftNs{}; // from the time of the log to the elapsed one
        int64_t latestNs{};
        int64_t firstGeneration{};
        int64_t generation{};
        std::optional<Measurement> waiting; // went back
        int64_t waitingLine{};

        Measurement& last() { return waiting ? *waiting : taken.back(); }
    };
    struct tSource {
        std::string name;
        std::string process;
        int64_t firstLine;
        int64_t lastLine;
        tTrack<tRecordedPair> pairs;
        tTrack<tRecordedSummary> summaries;
    };

    tSource& sourceOf(std::string_view name, std::string_view process);
    template <typename Measurement>
    std::string append(tTrack<Measurement>& track, Measurement measurement);
    template <typename Measurement>
    void beginStretch(tTrack<Measurement>& track, Measurement measurement, int64_t gapNs);
    template <typename Measurement> void dropWaiting(tTrack<Measurement>& track);
    template <typename Measurement>
    static void join(tTrack<Measurement>& earlier, tTrack<Measurement>&& later);
    void joinProcesses();
    tSource& chosen(const std::string& name, const std::string& wanted);

    int64_t line = 0;
    int64_t generation = 0;
    int64_t taken = 0;
    std::vector<tSource> sources;
    std::unordered_map<std::string, size_t> indices; // by name and process
    size_t latest{};                                 // mostly the next line's as well
    int64_t unreadLines = 0;
    std::vector<tUnreadLine> firstUnread;
    int64_t events = 0;
    std::vector<std::string> notes;
    bool intervalUsed = false;
    bool unitUsed = false;
};

} // namespace dravikHost
