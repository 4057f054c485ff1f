#include "sources/tScenario.h"

#include "text/quantity.h"
#include "text/words.h"

#include <fmt/format.h>

#include <cmath>
#include <stdexcept>

namespace dravikHost {

namespace {

// The bounds are those of the options of the same meaning; all keep times within 64 bits.
constexpr double kFiftyYearsNs = 438300 * 3600e9;
constexpr double kDayNs = 24 * 3600e9;
constexpr double kTenthPpb = 1e8; // of a clock's rate
constexpr double kMostNoisePpb = 1e6;
constexpr double kMostRampPpb = 1000; // each second

struct tKey {
    const char* name;
    const tQuantityKind& kind;
    double lowest, highest;
    void (*set)(tPhase& phase, double value);
};

int64_t whole(double ns) { return std::llround(ns); }

const std::vector<tKey> kOfClock = {
    {"offset", kDuration, -kFiftyYearsNs, kFiftyYearsNs,
     [](tPhase& phase, double ns) { phase.stepNs = whole(ns); }},
    {"frequency", kFrequency, -kTenthPpb, kTenthPpb,
     [](tPhase& phase, double ppb) { phase.frequencyPpb = ppb; }},
    {"white", kFrequency, 0, kMostNoisePpb,
     [](tPhase& phase, double ppb) { phase.oscillator.frequencyNoisePpb = ppb; }},
    {"wander", kFrequency, 0, kMostNoisePpb,
     [](tPhase& phase, double ppb) { phase.oscillator.frequencyWanderPpb = ppb; }},
    {"flicker", kFrequency, 0, kMostNoisePpb,
     [](tPhase& phase, double ppb) { phase.oscillator.drift.flickerPpb = ppb; }},
    {"sine", kFrequency, 0, kMostNoisePpb,
     [](tPhase& phase, double ppb) { phase.oscillator.drift.sinePpb = ppb; }},
    {"period", kDuration, 1, kFiftyYearsNs,
     [](tPhase& phase, double ns) { phase.oscillator.drift.sinePeriodNs = whole(ns); }},
    {"ramp", kFrequency, -kMostRampPpb, kMostRampPpb,
     [](tPhase& phase, double ppb) { phase.oscillator.drift.rampPpb = ppb; }},
};

const std::vector<tKey> kOfReference = {
    {"interval", kDuration, 1, kDayNs,
     [](tPhase& phase, double ns) { phase.measurement.intervalNs = whole(ns); }},
    {"noise", kDuration, 0, kDayNs,
     [](tPhase& phase, double ns) { phase.measurement.noiseNs = ns; }},
    {"flicker", kDuration, 0, kDayNs,
     [](tPhase& phase, double ns) { phase.measurement.flickerNs = ns; }},
    {"outliers", kRatio, 0, 1,
     [](tPhase& phase, double rate) { phase.measurement.outlierRate = rate; }},
    {"delayed", kRatio, 0, 1,
     [](tPhase& phase, double rate) { phase.measurement.delayedRate = rate; }},
    {"size", kDuration, 0, kDayNs,
     [](tPhase& phase, double ns) { phase.measurement.outlierSizeNs = ns; }},
    {"delay", kDuration, 0, kDayNs,
     [](tPhase& phase, double ns) { phase.measurement.delayNs = ns; }},
    {"granularity", kDuration, 1, kDayNs,
     [](tPhase& phase, double ns) {
         phase.measurement.granularityNs = static_cast<uint64_t>(whole(ns));
     }},
    {"missing", kRatio, 0, 1,
     [](tPhase& phase, double rate) { phase.measurement.missingRate = rate; }},
};

[[noreturn]] void refuse(const std::string& why) { throw std::invalid_argument(why); }

std::string_view needWord(std::string_view& rest, const char* what)
{
    const std::string_view word = takeWord(rest);
    if (word.empty()) refuse(fmt::format("lacks {}", what));
    return word;
}

void needEnd(std::string_view rest)
{
    const std::string_view word = takeWord(rest);
    if (!word.empty()) refuse(fmt::format("has '{}' too much", word));
}

double within(const char* name, const tQuantityKind& kind, std::string_view text, double lowest,
              double highest)
{
    const double value = parseQuantity(text, kind);
    if (!(value >= lowest && value <= highest))
        refuse(fmt::format("{}: '{}' is out of range", name, text));
    return value;
}

const tKey& keyNamed(std::string_view name, const std::vector<tKey>& keys)
{
    std::vector<std::string> names;
    for (const tKey& key : keys) {
        if (name == key.name) return key;
        names.emplace_back(key.name);
    }
    refuse(fmt::format("unknown key '{}'{}", name, didYouMean(name, names)));
}

// A scenario in the making: the last phase is the one that statements are about.
class tBuilder
{
public:
    explicit tBuilder(const tScenarioStart& start)
        : keepsInterval(start.keepsInterval), phases{start.phase}
    {}

    void take(std::string_view line)
    {
        std::string_view rest = line.substr(0, line.find('#'));
        const std::string_view word = takeWord(rest);
        if (word.empty()) return;
        if (word == "at") {
            enter(within("at", kDuration, needWord(rest, "a time"), 1, kFiftyYearsNs));
            happen(needWord(rest, "what happens"), rest);
            return;
        }
        if (phases.size() > 1) refuse("comes after statements with a time");
        if (change(word, rest)) return;
        refuse(fmt::format("unknown statement '{}'{}", word,
                           didYouMean(word, {"clock", "reference", "at"})));
    }

    tScenario done() { return std::move(phases); }

private:
    void enter(double atNs)
    {
        tPhase next = phases.back();
        next.fromNs = whole(atNs);
        if (next.fromNs == phases.back().fromNs) return;
        if (next.fromNs < phases.back().fromNs) refuse("is before the statement above it");
        next.stepNs = next.jumpNs = 0;
        next.frequencyPpb = 0;
        phases.push_back(next);
    }

    void happen(std::string_view word, std::string_view rest)
    {
        tPhase& now = phases.back();
        if (change(word, rest)) return;
        if (word == "jump") {
            now.jumpNs =
                whole(within("jump", kDuration, needWord(rest, "a time"), -kDayNs, kDayNs));
        } else if (word == "silence" || word == "resume") {
            now.silent = word == "silence";
        } else {
            refuse(
                fmt::format("unknown event '{}'{}", word,
                            didYouMean(word, {"clock", "reference", "jump", "silence", "resume"})));
        }
        needEnd(rest);
    }

    bool change(std::string_view what, std::string_view rest)
    {
        if (what != "clock" && what != "reference") return false;
        const std::vector<tKey>& keys = what == "clock" ? kOfClock : kOfReference;
        for (std::string_view word = needWord(rest, "KEY=VALUE"); !word.empty();
             word = takeWord(rest)) {
            const size_t equals = word.find('=');
            if (equals == std::string_view::npos) refuse(fmt::format("'{}' is no KEY=VALUE", word));
            const tKey& key = keyNamed(word.substr(0, equals), keys);
            if (keepsInterval && word.substr(0, equals) == "interval")
                refuse("interval: given by an option as well");
            key.set(phases.back(),
                    within(key.name, key.kind, word.substr(equals + 1), key.lowest, key.highest));
        }
        const tDriftModel& drift = phases.back().oscillator.drift;
        if (drift.sinePpb != 0 && drift.sinePeriodNs == 0) refuse("sine lacks a period");
        return true;
    }

    bool keepsInterval;
    tScenario phases;
};

} // namespace

tScenario parseScenario(std::string_view text, const std::string& name, const tScenarioStart& start)
{
    tBuilder builder(start);
    for (int line = 1; !text.empty(); ++line) {
        try {
            builder.take(takeLine(text));
        } catch (const std::invalid_argument& failure) {
            throw std::runtime_error(fmt::format("{}:{}: {}", name, line, failure.what()));
        }
    }
    return builder.done();
}

} // namespace dravikHost
