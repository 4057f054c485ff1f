#include "traces/iTraceFormat.h"

#include "servo/tLockObserver.h"
#include "text/words.h"
#include "traces/lineShape.h"
#include "traces/tableRow.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cmath>
#include <optional>
#include <stdexcept>

namespace dravikHost {

namespace {

// CSV with a header that names at least reference_ns and clock_ns, in any order and case, between
// commas, semicolons or tabs, as spreadsheets write it. Also read are
// elapsed_s, true_error_ns, frequency_ppb (in force from this pair on), step_ns (by which the clock
// was stepped after it), and what this program writes: kind, call and value, the calls of each pair
// in rows of their own, and orders of a dry run, which did not reach the clock.
class tCsvFormat : public iTraceFormat
{
public:
    std::string name() const override { return "CSV with reference_ns and clock_ns"; }
    tLine read(std::string_view line, tRecordingBuilder& builder) override;
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
    using tFields = std::array<std::string, kColumns>;
    struct tOrder {
        int64_t elapsedNs;
        double ppb;
    };

    static int columnOf(const std::string& title);
    static bool isHeader(std::string_view line);
    bool readHeader(std::string_view line);
    std::optional<tFields> split(std::string_view line) const;
    tLine readPair(const tFields& fields, tRecordingBuilder& builder);
    static std::optional<tHostCall> callIn(const tFields& fields);
    tLine readCall(const tFields& fields, tRecordingBuilder& builder);
    std::string cutShort(const tFields& fields);
    void averageOrders(tRecordingBuilder& builder, int64_t untilNs);
    void endPair(tRecordingBuilder& builder);

    std::string header;
    char separator = ',';
    std::vector<int> columns; // of the file's fields in turn; -1: not used
    size_t latestDigits = 0;  // of the last field of a pair, if that is a time
    bool hasCalls = false;
    tHostCalls calls; // of the last pair
    std::optional<tLockObserver> observer;
    double lowestPpb{};
    double highestPpb{};
    std::optional<double> orderedPpb;
    std::vector<tOrder> orders;       // since the last pair; one may come while none does
    std::optional<double> initialPpb; // before anything was ordered
};

constexpr std::array kTitles = {"reference_ns",  "clock_ns",      "elapsed_s",
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

int tCsvFormat::columnOf(const std::string& title)
{
    std::string name = title;
    std::transform(name.begin(), name.end(), name.begin(), [](unsigned char character) {
        return character == ' ' ? '_' : static_cast<char>(std::tolower(character));
    });
    const auto found = std::find(kTitles.begin(), kTitles.end(), name);
    return found == kTitles.end() ? -1 : static_cast<int>(found - kTitles.begin());
}

bool tCsvFormat::isHeader(std::string_view line)
{
    if (std::isalpha(static_cast<unsigned char>(line.front())) == 0) return false;
    const std::vector<std::string> titles = fieldsOf(line, separatorOf(line));
    return std::any_of(titles.begin(), titles.end(),
                       [](const std::string& title) { return columnOf(title) == kClock; });
}

tLine tCsvFormat::read(std::string_view line, tRecordingBuilder& builder)
{
    if (line.find_first_not_of(" \t,;") == std::string_view::npos || line.front() == '#')
        return {tLine::kFrame, ""};
    if (columns.empty()) {
        return readHeader(line) ? tLine{tLine::kFrame, ""}
                                : tLine::foreign("no header with reference_ns and clock_ns");
    }
    if (line == header) return {tLine::kFrame, ""};
    const auto fields = split(line);
    if (isHeader(line)) throw std::runtime_error("a second header differs from the first");
    if (!fields) return tLine::unread("not as many fields as the header has");
    const std::string& kind = (*fields)[kKind];
    if (kind.empty() || kind == "pair") return readPair(*fields, builder);
    if (kind == "call" || kind == "held") return readCall(*fields, builder);
    return tLine::unread(fmt::format("a row of the unknown kind '{}'", printable(kind, 20)));
}

// Throws std::runtime_error if it is one, but cannot be told what it means.
bool tCsvFormat::readHeader(std::string_view line)
{
    separator = separatorOf(line);
    const std::vector<std::string> titles = fieldsOf(line, separator);
    std::array<int, kColumns> counts{};
    for (const std::string& title : titles) {
        columns.push_back(columnOf(title));
        if (columns.back() >= 0) ++counts[static_cast<size_t>(columns.back())];
    }
    if (counts[kReference] == 0 || counts[kClock] == 0) {
        columns.clear();
        return false;
    }
    for (size_t i = 0; i < kColumns; ++i) {
        if (counts[i] > 1) {
            throw std::runtime_error(
                fmt::format("the column {} stands there {} times", kTitles[i], counts[i]));
        }
    }
    header = line;
    return true;
}

// Nothing if there are fewer or more fields than titles; spreadsheets add empty ones.
std::optional<tCsvFormat::tFields> tCsvFormat::split(std::string_view line) const
{
    const std::vector<std::string> found = fieldsOf(line, separator);
    if (found.size() < columns.size()) return std::nullopt;
    tFields fields;
    for (size_t i = 0; i < found.size(); ++i) {
        if (i >= columns.size()) {
            if (!found[i].empty()) return std::nullopt;
        } else if (columns[i] >= 0) {
            fields[static_cast<size_t>(columns[i])] = found[i];
        }
    }
    return fields;
}

// A time that ends the row and lost digits against the one before.
std::string tCsvFormat::cutShort(const tFields& fields)
{
    if (columns.back() != kClock && columns.back() != kReference) return "";
    const std::string& field = fields[static_cast<size_t>(columns.back())];
    const size_t digits = std::min(field.find('.'), field.size());
    const bool shorter = digits < latestDigits;
    if (shorter) return "cut short";
    latestDigits = digits;
    return "";
}

tLine tCsvFormat::readPair(const tFields& fields, tRecordingBuilder& builder)
{
    const auto readsTime = [this](const std::string& field) -> std::optional<tExactNs> {
        if (field.find_first_of("eE-") != std::string::npos) return std::nullopt;
        return exactNsOf(field, separator, 1);
    };
    for (const tColumn column : {kReference, kClock}) {
        if (fields[column].find_first_of("eE") != std::string::npos && finiteIn(fields[column]))
            return tLine::unread("a time whose last digits a spreadsheet has rounded away");
    }
    const auto reference = readsTime(fields[kReference]);
    const auto clock = readsTime(fields[kClock]);
    if (!reference || !clock) return tLine::unread("no number in reference_ns or in clock_ns");
    const auto elapsedNs = fields[kElapsed].empty()
                               ? std::optional(static_cast<int64_t>(reference->whole))
                               : secondsIn(fields[kElapsed]);
    if (!elapsedNs) return tLine::unread("elapsed_s is not a time");
    const auto trueErrorNs = optionalIn<double>(fields[kTrueError]);
    const auto stepNs = optionalIn<int64_t>(fields[kStep]);
    const auto frequencyPpb = optionalIn<double>(fields[kFrequency]);
    if (!trueErrorNs || !stepNs || !frequencyPpb)
        return tLine::unread("no number in true_error_ns, step_ns or frequency_ppb");
    const std::string cut = cutShort(fields);
    if (!cut.empty()) return tLine::unread(cut);
    averageOrders(builder, *elapsedNs);
    endPair(builder);
    tRecordedPair pair{};
    pair.elapsedNs = *elapsedNs;
    pair.referenceNs = reference->whole;
    pair.clockNs = clock->whole;
    pair.errorNs = static_cast<double>(static_cast<int64_t>(clock->whole - reference->whole)) +
                   (clock->fraction - reference->fraction);
    pair.trueErrorNs = *trueErrorNs;
    pair.stepNs = stepNs->value_or(0);
    pair.orderedPpb = *frequencyPpb ? *frequencyPpb : orderedPpb;
    return tLine::added(builder.add("", pair));
}

// A row of a call; nothing if it is none that is known.
std::optional<tHostCall> tCsvFormat::callIn(const tFields& fields)
{
    const auto name =
        std::find(kHostOperationNames.begin(), kHostOperationNames.end(), fields[kCall]);
    if (name == kHostOperationNames.end()) return std::nullopt;
    const auto operation = static_cast<tHostOperation>(name - kHostOperationNames.begin());
    if (isOfFrequency(operation)) {
        const auto ppb = finiteIn(fields[kValue]);
        return ppb ? std::optional(tHostCall{operation, 0, *ppb}) : std::nullopt;
    }
    const auto ns = numberIn<int64_t>(fields[kValue]);
    return ns ? std::optional(tHostCall{operation, *ns}) : std::nullopt;
}

// Calls in front of the first pair tell the limits of the clock.
tLine tCsvFormat::readCall(const tFields& fields, tRecordingBuilder& builder)
{
    const auto call = callIn(fields);
    if (!call) return tLine::unread("no call that is known");
    if (calls.isFull()) return tLine::unread("more calls than a pair can have");
    hasCalls = true;
    calls.push_back(*call);
    if (fields[kKind] == "held") return {tLine::kFrame, ""};
    switch (call->operation) {
    case kGetMaxFrequencyOffset:
        highestPpb = call->ppb;
        break;
    case kGetMinFrequencyOffset:
        lowestPpb = call->ppb;
        break;
    case kGetFrequency:
        if (!initialPpb) initialPpb = call->ppb;
        break;
    case kSetFrequency:
        orderedPpb = call->ppb;
        orders.push_back({secondsIn(fields[kElapsed]).value_or(0), call->ppb});
        if (builder.last() != nullptr) builder.last()->orderedPpb = call->ppb;
        break;
    case kStepTime:
        if (builder.last() != nullptr) builder.last()->stepNs = call->ns;
        break;
    case kGetTime:
        break;
    }
    return {tLine::kFrame, ""};
}

// From pair to pair a clock has one rate here: if it was ordered another one in between, the mean.
void tCsvFormat::averageOrders(tRecordingBuilder& builder, int64_t untilNs)
{
    tRecordedPair* const last = builder.last();
    if (last != nullptr && orders.size() > 1) {
        double sum = 0;
        for (size_t i = 0; i < orders.size(); ++i) {
            const int64_t endNs = i + 1 < orders.size() ? orders[i + 1].elapsedNs : untilNs;
            sum += orders[i].ppb * static_cast<double>(endNs - orders[i].elapsedNs);
        }
        const auto passedNs = static_cast<double>(untilNs - orders.front().elapsedNs);
        if (passedNs > 0) last->orderedPpb = sum / passedNs;
    }
    orders.clear();
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
    if (builder.pairs() == nullptr) return;
    for (tRecordedPair& pair : *builder.pairs()) { // those before the first order
        if (pair.orderedPpb) break;
        pair.orderedPpb = initialPpb;
    }
}

} // namespace

void addCsvFormat(std::vector<tMakeFormat>& formats)
{
    formats.emplace_back([](const tReadOptions&) { return std::make_unique<tCsvFormat>(); });
}

} // namespace dravikHost
