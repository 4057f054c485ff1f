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

void addLibraryOption(CLI::App& app, std::string& library)
{
    app.add_option("--library", library,
                   "The plug-in; else $DRAVIK_LIBRARY, else\nlibdravik.so.1 beside this program or "
                   "as installed")
        ->type_name("FILE");
}
