#include "traces/iTraceFormat.h"

#include "text/words.h"

#include <array>

namespace dravikHost {

namespace {

// What ptp4l, phc2sys and ts2phc, and this program's own run, print for each measurement, with or
// without the prefix of a system log:
//
//     ptp4l[1234.567]: master offset        -23 s2 freq  -12345 path delay       500
//     Nov 23 08:35:26 host phc2sys: [1234.567] CLOCK_REALTIME phc offset  23 s2 freq +12 delay 500
//
// The offset is local minus reference, in ns. Freq is the correction, in ppb, that was applied with
// its sign turned; in state s1 the clock was also stepped by minus the offset.
class tDaemonLogFormat : public iTraceFormat
{
public:
    const char* name() const override { return "lines of ptp4l, phc2sys or ts2phc"; }
    bool recognises(std::string_view line) const override;
    std::string read(std::string_view line, tRecordingBuilder& builder) override;
};

struct tMeasurement {
    int64_t timeNs;
    int64_t offsetNs;
    int state;
    int64_t freqPpb;
    std::string source; // the program, and the clock if it names one
};

constexpr std::array<std::string_view, 4> kPrograms = {"ptp4l", "phc2sys", "ts2phc", "dravik-host"};

std::string_view programIn(std::string_view text)
{
    std::string_view last; // before it may stand a host of such a name
    size_t lastAt = 0;
    for (const std::string_view program : kPrograms) {
        const size_t at = text.rfind(program);
        if (at == std::string_view::npos || at < lastAt) continue;
        last = program;
        lastAt = at;
    }
    return last;
}

// Splits off everything up to the monotonic time, the first bracket that has a decimal point: a
// system log writes the number of the process the same way.
std::optional<int64_t> takeTime(std::string_view& text)
{
    for (size_t open = text.find('['); open != std::string_view::npos;
         open = text.find('[', open + 1)) {
        const size_t close = text.find(']', open);
        if (close == std::string_view::npos) return std::nullopt;
        const std::string_view inside = text.substr(open + 1, close - open - 1);
        const auto timeNs = secondsIn(inside);
        if (!timeNs || inside.find('.') == std::string_view::npos) continue;
        text.remove_prefix(close + 1);
        return timeNs;
    }
    return std::nullopt;
}

// A clock is named by a word that is neither a tag nor one of the words in front of "offset".
bool namesClock(std::string_view word)
{
    return word != ":" && word.front() != '[' && word != "master" && word != "phc" && word != "sys";
}

std::optional<tMeasurement> parse(std::string_view line)
{
    tMeasurement found{};
    std::string_view rest = line;
    const auto timeNs = takeTime(rest);
    if (!timeNs) return std::nullopt;
    const std::string_view program = programIn(line.substr(0, line.size() - rest.size()));
    if (program.empty()) return std::nullopt;
    found.source = program;
    std::string_view word = takeWord(rest);
    for (; word != "offset"; word = takeWord(rest)) {
        if (word.empty()) return std::nullopt;
        if (namesClock(word)) found.source.append(" ").append(word);
    }
    const auto offsetNs = numberIn<int64_t>(takeWord(rest));
    const std::string_view state = takeWord(rest);
    const bool hasFreq = takeWord(rest) == "freq";
    const auto freqPpb = numberIn<int64_t>(takeWord(rest));
    if (!offsetNs || state.size() != 2 || state[0] != 's' || !hasFreq || !freqPpb)
        return std::nullopt;
    found.timeNs = *timeNs;
    found.offsetNs = *offsetNs;
    found.state = state[1] - '0';
    found.freqPpb = *freqPpb;
    return found;
}

bool tDaemonLogFormat::recognises(std::string_view line) const { return parse(line).has_value(); }

std::string tDaemonLogFormat::read(std::string_view line, tRecordingBuilder& builder)
{
    constexpr int kJump = 1;
    constexpr int kLocked = 2;
    const auto measurement = parse(line);
    if (!measurement) return "no measurement";
    tRecordedPair pair{};
    pair.elapsedNs = measurement->timeNs;
    pair.referenceNs = kMadeUpStartNs + static_cast<uint64_t>(measurement->timeNs);
    pair.clockNs = pair.referenceNs + static_cast<uint64_t>(measurement->offsetNs);
    pair.errorNs = static_cast<double>(measurement->offsetNs);
    pair.orderedPpb = -static_cast<double>(measurement->freqPpb);
    pair.stepNs = measurement->state == kJump ? -measurement->offsetNs : 0;
    pair.locked = measurement->state >= kLocked;
    return builder.add(measurement->source, pair);
}

} // namespace

std::unique_ptr<iTraceFormat> daemonLogFormat() { return std::make_unique<tDaemonLogFormat>(); }

} // namespace dravikHost
