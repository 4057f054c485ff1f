#include "traces/tRecordingBuilder.h"

#include "traces/lineShape.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>
#include <stdexcept>
#include <unordered_set>

namespace dravikHost {

namespace {

constexpr size_t kUnreadKept = 3;
constexpr int64_t kMostMeasurements = 10'000'000; // about 1 GB
constexpr size_t kMostSources = 100'000;
constexpr size_t kNamesShown = 10;
constexpr size_t kMostOfName = 80;

std::string listOf(const std::vector<std::string>& names)
{
    std::string list;
    for (size_t i = 0; i < std::min(names.size(), kNamesShown); ++i)
        list += fmt::format("{}'{}'", i == 0 ? "" : ", ", printable(names[i], kMostOfName));
    if (names.size() > kNamesShown)
        list += fmt::format(" and {} others", names.size() - kNamesShown);
    return list;
}

} // namespace

tRecordedPair pairOf(int64_t momentNs, double errorNs, uint64_t startNs)
{
    tRecordedPair pair{};
    pair.elapsedNs = momentNs;
    pair.errorNs = errorNs;
    pair.referenceNs = startNs + static_cast<uint64_t>(momentNs);
    pair.clockNs = pair.referenceNs + static_cast<uint64_t>(std::llround(errorNs));
    return pair;
}

std::string tRecordingBuilder::add(std::string_view source, const tRecordedPair& pair,
                                   std::string_view process)
{
    return append(sourceOf(source, process).pairs, pair);
}

std::string tRecordingBuilder::add(std::string_view source, const tRecordedSummary& summary,
                                   std::string_view process)
{
    return append(sourceOf(source, process).summaries, summary);
}

tRecordingBuilder::tSource& tRecordingBuilder::sourceOf(std::string_view name,
                                                        std::string_view process)
{
    const bool same = latest < sources.size() && sources[latest].name == name &&
                      sources[latest].process == process;
    if (!same) {
        const std::string key = std::string(name) + '\n' + std::string(process);
        latest = indices.emplace(key, sources.size()).first->second;
        if (latest == sources.size())
            sources.push_back({std::string(name), std::string(process), line, line, {}, {}});
        if (sources.size() > kMostSources)
            throw std::runtime_error(fmt::format("more than {} sources", kMostSources));
    }
    sources[latest].lastLine = line;
    return sources[latest];
}

template <typename Measurement>
std::string tRecordingBuilder::append(tTrack<Measurement>& track, Measurement measurement)
{
    if (++taken > kMostMeasurements) {
        throw std::runtime_error(
            fmt::format("more than {} measurements; give a part of it", kMostMeasurements));
    }
    const int64_t timeNs = measurement.elapsedNs;
    if (track.taken.empty()) {
        track.firstNs = timeNs;
        track.shiftNs = -timeNs;
        track.firstGeneration = generation;
        track.generation = generation;
    } else if (track.generation != generation) {
        dropWaiting(track);
        track.generation = generation;
        beginStretch(track, measurement, 1);
        return "";
    }
    if (track.waiting) {
        const int64_t waitingNs = track.waiting->elapsedNs;
        if (timeNs > waitingNs && timeNs <= track.latestNs) {
            beginStretch(track, *track.waiting, timeNs - waitingNs);
            track.waiting.reset();
        } else if (timeNs != waitingNs) {
            dropWaiting(track);
        }
    }
    if (!track.taken.empty() &&
        timeNs == (track.waiting ? track.waiting->elapsedNs : track.latestNs)) {
        --taken;
        return "time does not advance";
    }
    if (!track.taken.empty() && timeNs < track.latestNs) {
        track.waiting = measurement;
        track.waitingLine = line;
        return "";
    }
    track.latestNs = timeNs;
    measurement.elapsedNs += track.shiftNs;
    track.taken.push_back(measurement);
    return "";
}

// How long the time in between was is not known; elapsed time goes on by the gap.
template <typename Measurement>
void tRecordingBuilder::beginStretch(tTrack<Measurement>& track, Measurement measurement,
                                     int64_t gapNs)
{
    track.latestNs = measurement.elapsedNs;
    track.shiftNs = track.taken.back().elapsedNs + gapNs - track.latestNs;
    measurement.elapsedNs += track.shiftNs;
    measurement.beginsStretch = true;
    track.taken.push_back(measurement);
}

template <typename Measurement> void tRecordingBuilder::dropWaiting(tTrack<Measurement>& track)
{
    if (!track.waiting) return;
    --taken;
    setUnread(track.waitingLine, "time goes back");
    track.waiting.reset();
}

void tRecordingBuilder::setUnread(int64_t lineNumber, const std::string& why)
{
    ++unreadLines;
    if (firstUnread.size() < kUnreadKept) firstUnread.push_back({lineNumber, why});
}

tRecordedPair* tRecordingBuilder::last()
{
    if (sources.empty() || sources[0].pairs.taken.empty()) return nullptr;
    return &sources[0].pairs.last();
}

std::vector<tRecordedPair>* tRecordingBuilder::pairs()
{
    return sources.empty() ? nullptr : &sources[0].pairs.taken;
}

template <typename Measurement>
void tRecordingBuilder::join(tTrack<Measurement>& earlier, tTrack<Measurement>&& later)
{
    if (later.taken.empty()) return;
    if (earlier.taken.empty()) {
        earlier = std::move(later);
        return;
    }
    const bool back =
        later.firstNs <= earlier.latestNs || later.firstGeneration != earlier.generation;
    const int64_t laterByNs =
        back ? earlier.taken.back().elapsedNs + 1 : later.firstNs + earlier.shiftNs;
    later.taken.front().beginsStretch = back;
    for (Measurement& measurement : later.taken) {
        measurement.elapsedNs += laterByNs;
        earlier.taken.push_back(measurement);
    }
    earlier.shiftNs = later.shiftNs + laterByNs;
    earlier.latestNs = later.latestNs;
    earlier.generation = later.generation;
}

// A program that was started again goes on; programs that ran side by side get names of their own.
void tRecordingBuilder::joinProcesses()
{
    std::unordered_map<std::string, int64_t> lastLines;
    std::unordered_set<std::string> sideBySide;
    for (const tSource& source : sources) {
        const auto [at, first] = lastLines.emplace(source.name, source.lastLine);
        if (!first && source.firstLine < at->second) sideBySide.insert(source.name);
        at->second = std::max(at->second, source.lastLine);
    }
    std::vector<tSource> joined;
    std::unordered_map<std::string, size_t> firstOfName;
    for (tSource& source : sources) {
        if (sideBySide.count(source.name) > 0) {
            source.name += fmt::format(" ({})", source.process);
            joined.push_back(std::move(source));
            continue;
        }
        const auto [at, first] = firstOfName.emplace(source.name, joined.size());
        if (first) {
            joined.push_back(std::move(source));
            continue;
        }
        join(joined[at->second].pairs, std::move(source.pairs));
        join(joined[at->second].summaries, std::move(source.summaries));
    }
    sources = std::move(joined);
}

tRecordingBuilder::tSource& tRecordingBuilder::chosen(const std::string& name,
                                                      const std::string& wanted)
{
    std::vector<std::string> names;
    std::vector<tSource*> fitting;
    for (tSource& source : sources) {
        names.push_back(source.name);
        if (source.name == wanted && !wanted.empty()) return source;
        if (source.name.find(wanted) != std::string::npos) fitting.push_back(&source);
    }
    if (fitting.size() == 1) return *fitting.front();
    if (sources.empty()) throw std::runtime_error(name + " has no measurement");
    if (!fitting.empty()) {
        throw std::runtime_error(
            fmt::format("{} has several sources, choose one by --source: {}", name, listOf(names)));
    }
    const bool named = !names.front().empty();
    throw std::runtime_error(fmt::format("{} has no source '{}', but {}", name, wanted,
                                         named ? listOf(names) : "one without a name"));
}

tRecording tRecordingBuilder::finish(const std::string& name, const std::string& format,
                                     const std::string& wanted)
{
    for (tSource& source : sources) {
        dropWaiting(source.pairs);
        dropWaiting(source.summaries);
    }
    joinProcesses();
    tSource& source = chosen(name, wanted);
    tRecording recording;
    recording.name = name;
    recording.format = format;
    recording.source = printable(source.name, kMostOfName);
    recording.pairs = std::move(source.pairs.taken);
    recording.summaries = std::move(source.summaries.taken);
    if (!recording.pairs.empty() && !recording.summaries.empty()) {
        recording.notes.push_back(
            fmt::format("{} summaries are left out", recording.summaries.size()));
    }
    recording.unreadLines = unreadLines;
    recording.firstUnread = std::move(firstUnread);
    recording.events = events;
    recording.notes.insert(recording.notes.end(), notes.begin(), notes.end());
    return recording;
}

} // namespace dravikHost
