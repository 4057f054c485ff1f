#include "traces/iTraceFormat.h"

#include "text/words.h"
#include "traces/lineShape.h"
#include "traces/moments.h"

#include <cmath>

namespace dravikHost {

namespace {

tLine addTo(tRecordingBuilder& builder, std::string_view source, std::optional<int64_t> momentNs,
            std::optional<double> errorNs)
{
    if (!momentNs) return tLine::unread("no date and time");
    if (!errorNs || !(std::fabs(*errorNs) < kMostErrorNs))
        return tLine::unread("the offset is no number");
    return tLine::added(builder.add(source, pairOf(*momentNs, *errorNs, 0)));
}

std::string_view trimmed(std::string_view field)
{
    while (!field.empty() && field.front() == ' ')
        field.remove_prefix(1);
    while (!field.empty() && field.back() == ' ')
        field.remove_suffix(1);
    return field;
}

// sfptpd's statistics, each pair of clocks a source; the offset is local minus reference, in ns:
//
//     2016-03-03 10:04:41.413263 [ptp1->system(em1)], offset: 12.375, freq-adj: 1234.562, ...
class tSfptpdFormat : public iTraceFormat
{
public:
    std::string name() const override { return "sfptpd's statistics"; }

    tLine read(std::string_view line, tRecordingBuilder& builder) override
    {
        const tWords words = wordsOf(line);
        if (words.empty()) return {tLine::kFrame, ""};
        const size_t open = line.find('[');
        const size_t close = line.find("], offset: ");
        const bool pair = open != std::string_view::npos && close != std::string_view::npos &&
                          line.substr(open, close - open).find("->") != std::string_view::npos;
        const auto momentNs = words.size() < 2 ? std::nullopt : moments.ofDate(words[0], words[1]);
        const bool event = momentNs && words.size() > 2 && words[2].back() == ':';
        if (!pair) return event ? tLine{tLine::kEvent, ""} : tLine::foreign("no measurement");
        const std::string_view rest = line.substr(close + 11);
        const size_t end = rest.find(", ");
        if (end == std::string_view::npos) return tLine::unread("cut short");
        return addTo(builder, line.substr(open + 1, close - open - 1), momentNs,
                     finiteIn(trimmed(rest.substr(0, end))));
    }

private:
    tMoments moments;
};

// ptpd's statistics, one series over changing masters; the offset is local minus reference, in s:
//
//     2015-06-11 13:20:13.123456, slv, CLOCK,  0.000010234,  0.000000123,  0.000010000, ...
class tPtpdFormat : public iTraceFormat
{
public:
    std::string name() const override { return "ptpd's statistics"; }

    tLine read(std::string_view line, tRecordingBuilder& builder) override
    {
        constexpr size_t kOffsetAt = 4;
        std::vector<std::string_view> fields;
        for (std::string_view rest = line; !rest.empty();)
            fields.push_back(trimmed(takeField(rest)));
        if (fields.empty()) return {tLine::kFrame, ""};
        if (fields[0].substr(0, 1) == "#" || fields[0] == "Timestamp") {
            const bool ours =
                fields.size() > kOffsetAt && fields[kOffsetAt] == "Offset From Master";
            return ours ? tLine{tLine::kFrame, ""} : tLine::foreign("no measurement");
        }
        auto momentNs = moments.ofIso(fields[0]);
        if (!momentNs) momentNs = secondsIn(fields[0]);
        if (fields.size() > 1 && secondsIn(fields[1])) fields.erase(fields.begin() + 1); // both
        if (!momentNs || fields.size() < 3) return tLine::foreign("no measurement");
        if (fields[1] != "slv") return {tLine::kEvent, "not in the state slv"};
        if (fields.size() <= kOffsetAt + 1) return tLine::unread("cut short");
        const bool whole =
            fields[kOffsetAt].find('.') == std::string_view::npos; // commas for points
        const auto seconds = whole ? std::nullopt : finiteIn(fields[kOffsetAt]);
        return addTo(builder, "", momentNs, seconds ? std::optional(*seconds * 1e9) : std::nullopt);
    }

private:
    tMoments moments;
};

} // namespace

void addOtherDaemonFormats(std::vector<tMakeFormat>& formats)
{
    formats.emplace_back([](const tReadOptions&) { return std::make_unique<tSfptpdFormat>(); });
    formats.emplace_back([](const tReadOptions&) { return std::make_unique<tPtpdFormat>(); });
}

} // namespace dravikHost
