#include "traces/tRecordingBuilder.h"

#include <fmt/format.h>

#include <algorithm>
#include <stdexcept>

namespace dravikHost {

namespace {

constexpr size_t kUnreadKept = 3;

std::string listOf(const std::vector<std::string>& names)
{
    std::string list;
    for (const std::string& name : names)
        list += fmt::format("{}'{}'", list.empty() ? "" : ", ", name);
    return list;
}

} // namespace

std::string tRecordingBuilder::add(std::string_view source, tRecordedPair pair)
{
    if (!isWanted(source)) return "";
    if (pairs.empty()) startNs = pair.elapsedNs;
    pair.elapsedNs -= startNs;
    if (!pairs.empty() && pair.elapsedNs <= pairs.back().elapsedNs) return "time does not advance";
    pairs.push_back(pair);
    return "";
}

// Mostly the same source as the time before.
bool tRecordingBuilder::isWanted(std::string_view source)
{
    if (latestSource >= sources.size() || sources[latestSource] != source) {
        const auto known = std::find(sources.begin(), sources.end(), source);
        latestSource = static_cast<size_t>(known - sources.begin());
        if (known == sources.end()) sources.emplace_back(source);
    }
    if (source == wanted && !exact) { // what has a part of the name only was not meant
        exact = true;
        pairs.clear();
    }
    return matches(source);
}

bool tRecordingBuilder::matches(std::string_view source) const
{
    return exact ? source == wanted : source.find(wanted) != std::string_view::npos;
}

void tRecordingBuilder::setUnread(int64_t lineNumber, const std::string& why)
{
    ++unreadLines;
    if (firstUnread.size() < kUnreadKept) firstUnread.push_back({lineNumber, why});
}

tRecording tRecordingBuilder::finish(const std::string& name, const std::string& format)
{
    const auto isMatch = [this](const std::string& source) { return matches(source); };
    if (std::count_if(sources.begin(), sources.end(), isMatch) > 1) {
        throw std::runtime_error(fmt::format("{} has several sources, choose one by --source: {}",
                                             name, listOf(sources)));
    }
    if (pairs.empty() && !sources.empty()) {
        const bool named = !sources.front().empty();
        throw std::runtime_error(fmt::format("{} has no source '{}', but {}", name, wanted,
                                             named ? listOf(sources) : "one without a name"));
    }
    if (pairs.empty()) throw std::runtime_error(fmt::format("{} has no measurement", name));
    return {name, format, std::move(pairs), unreadLines, std::move(firstUnread)};
}

} // namespace dravikHost
