#include "traces/iTraceFormat.h"

#include "text/words.h"
#include "traces/lineShape.h"
#include "traces/logMessage.h"

#include <cmath>
#include <unordered_map>

namespace dravikHost {

namespace {

// What ptp4l, phc2sys and ts2phc, and this program's own run, print for each measurement, with or
// without the prefix of a system log:
//
//     ptp4l[1234.567]: [ptp4l.0.config:6] master offset  -23 s2 freq  -12345 path delay  500
//     Nov 23 08:35:26 host phc2sys: [1234.567] CLOCK_REALTIME phc offset  23 s2 freq +12 delay 500
//     ptp4l[1234.567]: rms   23 max   45 freq -12345 +/-  12 delay   500 +/-   3
//
// The offset is local minus reference, in ns. Freq is the correction, in ppb, that was applied with
// its sign turned; in state s1 the clock was also stepped by minus the offset. The third sums up
// the measurements since the line before.
class tDaemonLogFormat : public iTraceFormat
{
public:
    explicit tDaemonLogFormat(const tReadOptions& options)
        : intervalNs(options.frequency ? std::nullopt : options.intervalNs)
    {}

    std::string name() const override { return "lines of ptp4l, phc2sys or ts2phc"; }
    tLine read(std::string_view line, tRecordingBuilder& builder) override;

private:
    tLine readOffset(const tLogMessage& message, const tWords& words, size_t at,
                     tRecordingBuilder& builder);
    tLine readSummary(const tLogMessage& message, const tWords& words, size_t at,
                      tRecordingBuilder& builder);
    tLine other(const tLogMessage& message, std::string_view line);
    std::optional<int64_t> momentOf(const tLogMessage& message, const std::string& source,
                                    tRecordingBuilder& builder);
    bool isCutShort(const tLogMessage& message, bool hasDelay);

    std::optional<double> intervalNs;
    std::unordered_map<std::string, int64_t> counts; // of lines without a stamp, by source
    std::unordered_map<std::string, bool> delays;    // whether a program tells them
    std::string head;                                // of a measurement, up to its number
};

// "[ptp4l.0.config:6]" names an instance and the level of the message.
std::string_view instanceIn(std::string_view tag)
{
    tag = tag.substr(1, tag.size() - (tag.back() == ']' ? 2 : 1));
    const size_t colon = tag.rfind(':');
    return colon != std::string_view::npos && colon + 2 == tag.size() ? tag.substr(0, colon) : tag;
}

// Where the output does not name the program, the words do.
std::string_view programBy(const tWords& words)
{
    if (words.size() >= 3 && words[words.size() - 3] == "path") return "ptp4l";
    for (const std::string_view word : words)
        if (word == "phc" || word == "sys") return "phc2sys";
    return "";
}

// The program, its instance and the clock, as far as they are named.
std::string sourceOf(const tLogMessage& message, const tWords& words, size_t end)
{
    std::string source = message.program;
    if (source.empty()) source = programBy(words);
    for (size_t i = 0; i < end; ++i) {
        std::string_view word = words[i];
        if (word == ":" || word == "master" || word == "phc" || word == "sys") continue;
        if (word.front() == '[') word = instanceIn(word);
        if (!source.empty()) source += ' ';
        source += word;
    }
    return source;
}

size_t indexOf(const tWords& words, std::string_view wanted)
{
    size_t i = 0;
    while (i < words.size() && words[i] != wanted)
        ++i;
    return i;
}

std::string_view wordAt(const tWords& words, size_t i) { return i < words.size() ? words[i] : ""; }

std::optional<double> plainNumber(std::string_view word)
{
    return word.find_first_of("eE") == std::string_view::npos ? finiteIn(word) : std::nullopt;
}

// -1 if there is no such state.
int stateIn(std::string_view word)
{
    const bool known = word.size() == 2 && word[0] == 's' && word[1] >= '0' && word[1] <= '3';
    return known ? word[1] - '0' : -1;
}

// Within "path delay 500" or "delay 500", its number not begun.
bool breaksOffInDelay(const tWords& words)
{
    const std::string_view last = words.back();
    return std::string_view("path").substr(0, last.size()) == last ||
           std::string_view("delay").substr(0, last.size()) == last;
}

bool isFreq(std::string_view word) { return word == "freq" || word == "adj"; }

tLine tDaemonLogFormat::read(std::string_view line, tRecordingBuilder& builder)
{
    constexpr size_t kMostWordsBefore = 5;
    const tLogMessage message = messageIn(line);
    const tWords words = wordsOf(message.text);
    if (words.empty() && message.seconds.empty()) return {tLine::kFrame, ""};
    const size_t offsetAt = indexOf(words, "offset");
    if (offsetAt < words.size() && offsetAt <= kMostWordsBefore &&
        wordAt(words, offsetAt + 1) != "from" &&
        (wordAt(words, offsetAt + 2).substr(0, 1) == "s" || isFreq(wordAt(words, offsetAt + 3)) ||
         words.size() <= offsetAt + 3)) {
        return readOffset(message, words, offsetAt, builder);
    }
    const size_t rmsAt = indexOf(words, "rms");
    if (rmsAt < words.size() && rmsAt <= kMostWordsBefore)
        return readSummary(message, words, rmsAt, builder);
    if (line.substr(0, 9) == "-- Reboot" || line.substr(0, 8) == "-- Boot ") builder.restart();
    return other(message, line);
}

// A line that cannot be read has its moment as well.
std::optional<int64_t> tDaemonLogFormat::momentOf(const tLogMessage& message,
                                                  const std::string& source,
                                                  tRecordingBuilder& builder)
{
    if (!message.seconds.empty() || !intervalNs) return secondsIn(message.seconds);
    builder.useInterval();
    return std::llround(*intervalNs * static_cast<double>(counts[source]++));
}

// A program that tells the delay once tells it in all lines.
bool tDaemonLogFormat::isCutShort(const tLogMessage& message, bool hasDelay)
{
    bool& tells = delays[message.program];
    tells = tells || hasDelay;
    return tells && !hasDelay;
}

tLine tDaemonLogFormat::readOffset(const tLogMessage& message, const tWords& words, size_t at,
                                   tRecordingBuilder& builder)
{
    constexpr int kJump = 1;
    constexpr int kLocked = 2;
    const std::string source = sourceOf(message, words, at);
    const auto momentNs = momentOf(message, source, builder);
    if (!momentNs) return tLine::unread("no time in front of it");
    if (words.size() < at + 5) return tLine::unread("cut short");
    const auto offsetNs = plainNumber(words[at + 1]);
    const int state = stateIn(words[at + 2]);
    const auto freqPpb = plainNumber(words[at + 4]);
    if (!offsetNs || !(std::fabs(*offsetNs) < kMostErrorNs))
        return tLine::unread("the offset is no number");
    if (state < 0) return tLine::unread("an unknown state");
    if (!isFreq(words[at + 3]) || !freqPpb) return tLine::unread("the frequency is no number");
    const size_t delayAt = indexOf(words, "delay");
    if (words.size() > at + 5 && breaksOffInDelay(words)) return tLine::unread("cut short");
    if (isCutShort(message, delayAt < words.size())) return tLine::unread("cut short");
    tRecordedPair pair = pairOf(*momentNs, *offsetNs);
    pair.orderedPpb = -*freqPpb;
    pair.stepNs = state == kJump ? -std::llround(*offsetNs) : 0;
    pair.locked = state >= kLocked;
    head = message.text.substr(0, message.text.find("offset") + 6);
    return tLine::added(builder.add(source, pair, message.process));
}

tLine tDaemonLogFormat::readSummary(const tLogMessage& message, const tWords& words, size_t at,
                                    tRecordingBuilder& builder)
{
    const std::string source = sourceOf(message, words, at);
    const auto momentNs = momentOf(message, source, builder);
    if (!momentNs) return tLine::unread("no time in front of it");
    const auto rmsNs = plainNumber(wordAt(words, at + 1));
    const auto greatestNs = plainNumber(wordAt(words, at + 3));
    if (words.size() < at + 5) return tLine::unread("cut short");
    if (!rmsNs || !greatestNs || words[at + 2] != "max" || *rmsNs < 0 ||
        !(*greatestNs < kMostErrorNs) || *rmsNs > *greatestNs + 1) {
        return tLine::unread("no numbers behind rms and max");
    }
    const tRecordedSummary summary{*momentNs, *rmsNs, *greatestNs};
    return tLine::added(builder.add(source, summary, message.process));
}

// Other things happen; a line that breaks off before its number is none of them.
tLine tDaemonLogFormat::other(const tLogMessage& message, std::string_view line)
{
    const std::string& text = message.text;
    const bool breaksOff = !message.seconds.empty() && text.size() < head.size() &&
                           head.compare(0, text.size(), text) == 0;
    const bool openStamp = line.find('[') != std::string_view::npos &&
                           line.find(']') == std::string_view::npos &&
                           line.find(' ') == std::string_view::npos;
    if (breaksOff || openStamp) return tLine::unread("cut short");
    const bool said = !message.seconds.empty() || line.find(": ") != std::string_view::npos ||
                      line.substr(0, 3) == "-- ";
    return said ? tLine{tLine::kEvent, ""} : tLine::foreign("no measurement");
}

} // namespace

void addDaemonLogFormat(std::vector<tMakeFormat>& formats)
{
    formats.emplace_back(
        [](const tReadOptions& options) { return std::make_unique<tDaemonLogFormat>(options); });
}

} // namespace dravikHost
