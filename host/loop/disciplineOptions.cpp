#include "loop/disciplineOptions.h"

#include "text/options.h"

#include <fmt/format.h>

namespace {

tLaterDocument parseLater(const std::string& text)
{
    const size_t equals = text.find('=');
    if (equals == std::string::npos || equals + 1 == text.size()) {
        throw CLI::ValidationError("--then",
                                   "'" + text + "' is not AFTER=FILE, such as 60s=a.json");
    }
    const tQuantityOption after = {"--then", kDuration, "", "0ns", "438300h", ""};
    return {static_cast<int64_t>(parseWithin(after, text.substr(0, equals))),
            text.substr(equals + 1)};
}

void addLater(std::vector<tLaterDocument>& later, const std::string& text)
{
    const tLaterDocument document = parseLater(text);
    if (!later.empty() && document.afterNs <= later.back().afterNs)
        throw CLI::ValidationError("--then", "'" + text + "' does not come after the one before");
    later.push_back(document);
}

} // namespace

void addDisciplineOptions(CLI::App& app, tDisciplineOptions& options)
{
    addQuantity(app, options.maxFrequencyOffsetPpb,
                {"--max-frequency-offset", kFrequency, "500ppm", "1ppb", "100000ppm",
                 "How far its rate can be changed"});
    addQuantity(app, options.measureOverNs,
                {"--measure-over", kDuration, "0ns", "0ns", "24h",
                 "Least time over which the frequency is\nmeasured; pairs between are held back"});
    const auto take = [&later = options.later](const std::vector<std::string>& texts) {
        for (const std::string& text : texts)
            addLater(later, text);
    };
    app.add_option_function<std::vector<std::string>>(
           "--then", take, "A further document once the lock has held\nso long; repeatable")
        ->type_name("AFTER=FILE")
        ->expected(1)
        ->take_all();
    app.add_option("--csv", options.csv, "Every pair and host call; - is stdout")
        ->type_name("FILE");
    addTuningOptions(app, options.tuning);
    addLibraryOption(app, options.library);
}

// The bounds keep all times of a run within 64 bits: 438300 h are fifty years.
void addInitialErrorOptions(CLI::App& app, tInitialError& error, const char* defaultOffset)
{
    addQuantity(app, error.offsetNs,
                {"--initial-offset", kDuration, defaultOffset, "-438300h", "438300h",
                 "How far the clock is ahead at the start"});
    addQuantity(app, error.frequencyPpb,
                {"--frequency-error", kFrequency, "12ppm", "-100000ppm", "100000ppm",
                 "How much too fast its oscillator is"});
}

std::string tInitialError::text() const
{
    return fmt::format("{} and {} off", signedDurationText(static_cast<double>(offsetNs)),
                       offsetText(frequencyPpb));
}
