#include "traces/iTraceFormat.h"

#include "servo/tLockObserver.h"
#include "text/words.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <optional>

namespace dravikHost {

namespace {

// CSV with a header that names at least reference_ns and clock_ns, in any order. Also read are
// elapsed_s, true_error_ns, frequency_ppb (in force from this pair on), step_ns (by which the clock
// was stepped after it), and what this program writes: kind, call and value, the calls of each pair
// in rows of their own, and orders of a dry run, which did not reach the clock.
class tCsvFormat : public iTraceFormat
{
public:
    const char* name() const override { return "CSV"; }
    bool recognises(std::string_view line) const override;
    std::string read(std::string_view line, tRecordingBuilder& builder) override;
    void finish(tRecordingBuilder& builder) override;

private:
    enum tColumn {
        kReference,
        kClock,
        kElapsed,
        kTrueError,
        kFrequency,
        kStep,
        kKind,
        kCall,
        kValue,
        kColumns
    };
    using tFields = std::array<std::string_view, kColumns>;

    static int columnOf(std::string_view title);
    void readHeader(std::string_view line);
    tFields split(std::string_view line) const;
    std::string readPair(const tFields& fields, tRecordingBuilder& builder);
    std::string readCall(const tFields& fields, tRecordingBuilder& builder);
    void endPair(tRecordingBuilder& builder);

    std::vector<int> columns; // of the file's fields in turn; -1: not used
    bool hasCalls = false;
    tHostCalls calls; // of the last pair
    std::optional<tLockObserver> observer;
    int32_t lowestPpb = 0;
    int32_t highestPpb = 0;
    std::optional<double> orderedPpb;
    std::optional<double> initialPpb; // before anything was ordered
};

constexpr std::array<std::string_view, 9> kTitles = {"reference_ns",  "clock_ns",      "elapsed_s",
                                                     "true_error_ns", "frequency_ppb", "step_ns",
                                                     "kind",          "call",          "value"};

// What a field says that may be empty; nothing if it is neither that nor a finite number.
template <typename Number> std::optional<std::optional<Number>> optionalIn(std::string_view field)
{
    if (field.empty()) return std::optional<Number>();
    const auto number = numberIn<Number>(field);
    if (!number || !std::isfinite(static_cast<double>(*number))) return std::nullopt;
    return number;
}

int tCsvFormat::columnOf(std::string_view title)
{
    const auto found = std::find(kTitles.begin(), kTitles.end(), title);
    return found == kTitles.end() ? -1 : static_cast<int>(found - kTitles.begin());
}

bool tCsvFormat::recognises(std::string_view line) const
{
    bool reference = false;
    bool clock = false;
    while (!line.empty()) {
        const int column = columnOf(takeField(line));
        reference = reference || column == kReference;
        clock = clock || column == kClock;
    }
    return reference && clock;
}

std::string tCsvFormat::read(std::string_view line, tRecordingBuilder& builder)
{
    if (columns.empty()) {
        readHeader(line);
        return "";
    }
    const tFields fields = split(line);
    if (fields[kKind].empty() || fields[kKind] == "pair") return readPair(fields, builder);
    if (fields[kKind] == "call" || fields[kKind] == "held") return readCall(fields, builder);
    return fmt::format("a row of the unknown kind '{}'", fields[kKind]);
}

void tCsvFormat::readHeader(std::string_view line)
{
    while (!line.empty())
        columns.push_back(columnOf(takeField(line)));
}

tCsvFormat::tFields tCsvFormat::split(std::string_view line) const
{
    tFields fields;
    for (const int column : columns) {
        const std::string_view field = takeField(line);
        if (column >= 0) fields[static_cast<size_t>(column)] = field;
    }
    return fields;
}

std::string tCsvFormat::readPair(const tFields& fields, tRecordingBuilder& builder)
{
    const auto referenceNs = numberIn<uint64_t>(fields[kReference]);
    const auto clockNs = numberIn<uint64_t>(fields[kClock]);
    if (!referenceNs || !clockNs) return "no whole number in reference_ns or in clock_ns";
    const auto elapsedNs = fields[kElapsed].empty()
                               ? std::optional(static_cast<int64_t>(*referenceNs))
                               : secondsIn(fields[kElapsed]);
    if (!elapsedNs) return "elapsed_s is not a time";
    const auto trueErrorNs = optionalIn<double>(fields[kTrueError]);
    const auto stepNs = optionalIn<int64_t>(fields[kStep]);
    const auto frequencyPpb = optionalIn<double>(fields[kFrequency]);
    if (!trueErrorNs || !stepNs || !frequencyPpb)
        return "no number in true_error_ns, step_ns or frequency_ppb";
    endPair(builder);
    tRecordedPair pair{};
    pair.elapsedNs = *elapsedNs;
    pair.referenceNs = *referenceNs;
    pair.clockNs = *clockNs;
    pair.errorNs = static_cast<double>(static_cast<int64_t>(*clockNs - *referenceNs));
    pair.trueErrorNs = *trueErrorNs;
    pair.stepNs = stepNs->value_or(0);
    pair.orderedPpb = *frequencyPpb ? *frequencyPpb : orderedPpb;
    return builder.add("", pair);
}

// Calls in front of the first pair tell the limits of the clock.
std::string tCsvFormat::readCall(const tFields& fields, tRecordingBuilder& builder)
{
    const auto operation =
        std::find(kHostOperationNames.begin(), kHostOperationNames.end(), fields[kCall]);
    const auto value = numberIn<int64_t>(fields[kValue]);
    if (operation == kHostOperationNames.end() || !value) return "no call that is known";
    hasCalls = true;
    calls.push_back({static_cast<tHostOperation>(operation - kHostOperationNames.begin()), *value});
    if (fields[kKind] == "held") return "";
    const auto ppb = static_cast<double>(*value);
    switch (static_cast<tHostOperation>(operation - kHostOperationNames.begin())) {
    case kGetMaxFrequencyOffset:
        highestPpb = static_cast<int32_t>(*value);
        break;
    case kGetMinFrequencyOffset:
        lowestPpb = static_cast<int32_t>(*value);
        break;
    case kGetFrequency:
        if (!initialPpb) initialPpb = ppb;
        break;
    case kSetFrequency:
        orderedPpb = ppb;
        if (builder.last() != nullptr) builder.last()->orderedPpb = ppb;
        break;
    case kStepTime:
        if (builder.last() != nullptr) builder.last()->stepNs = *value;
        break;
    case kGetTime:
        break;
    }
    return "";
}

// What the calls of the pair before say of its state.
void tCsvFormat::endPair(tRecordingBuilder& builder)
{
    if (builder.last() != nullptr) {
        if (!observer) observer.emplace(lowestPpb, highestPpb);
        observer->observe(calls);
        if (hasCalls) builder.last()->locked = observer->locked();
    }
    calls.clear();
}

void tCsvFormat::finish(tRecordingBuilder& builder)
{
    endPair(builder);
    for (tRecordedPair& pair : builder.all()) { // those before the first order
        if (pair.orderedPpb) break;
        pair.orderedPpb = initialPpb;
    }
}

} // namespace

std::unique_ptr<iTraceFormat> csvFormat() { return std::make_unique<tCsvFormat>(); }

} // namespace dravikHost
