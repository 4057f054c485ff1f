#include "text/options.h"

#include <fmt/format.h>

#include <stdexcept>

double parseWithin(const tQuantityOption& option, const std::string& text)
{
    const auto refuse = [&option](const std::string& why) -> double {
        throw CLI::ValidationError(option.name, why);
    };
    try {
        const double value = parseQuantity(text, option.kind);
        if (value >= parseQuantity(option.lowest, option.kind) &&
            value <= parseQuantity(option.highest, option.kind))
            return value;
    } catch (const std::invalid_argument& failure) {
        return refuse(failure.what());
    }
    return refuse(fmt::format("'{}' is not within {} to {}", text, option.lowest, option.highest));
}

// The bounds keep all times of a run within 64 bits: 438300 h are fifty years.
void addCommonOptions(CLI::App& app, tCommonOptions& options, const char* initialOffset)
{
    addQuantity(app, options.initialOffsetNs,
                {"--initial-offset", kDuration, initialOffset, "-438300h", "438300h",
                 "How far the clock is ahead at the start"});
    addQuantity(app, options.frequencyErrorPpb,
                {"--frequency-error", kFrequency, "12ppm", "-100000ppm", "100000ppm",
                 "How much too fast its oscillator is"});
    addQuantity(app, options.maxFrequencyOffsetPpb,
                {"--max-frequency-offset", kFrequency, "500ppm", "1ppb", "100000ppm",
                 "How far its rate can be changed"});
    app.add_option("--csv", options.csv, "Every pair and host call; - is stdout")
        ->type_name("FILE");
    addTuningOptions(app, options.tuning);
    addLibraryOption(app, options.library);
}

void addLibraryOption(CLI::App& app, std::string& library)
{
    app.add_option("--library", library,
                   "The plug-in; else $DRAVIK_LIBRARY, else\nlibdravik.so.1 beside this program or "
                   "as installed")
        ->type_name("FILE");
}
