#pragma once

#include "text/quantity.h"

#include <CLI/CLI.hpp>

#include <cmath>
#include <functional>
#include <optional>
#include <string>
#include <type_traits>

// One word of the command line: its options and what it does with them.
struct tVerb {
    CLI::App* app; // parsed if this verb was chosen
    std::function<void()> run;
};

// An option with a unit; default and bounds are written as a user would.
struct tQuantityOption {
    const char* name;
    const tQuantityKind& kind;
    const char* byDefault; // "": there is none, and the value stays as it is
    const char* lowest;
    const char* highest;
    const char* help;
};

// In the base unit of the kind; throws CLI::ValidationError.
double parseWithin(const tQuantityOption& option, const std::string& text);

template <typename Number>
void addQuantity(CLI::App& app, Number& value, const tQuantityOption& option)
{
    const auto parse = [&value, option](const std::string& text) {
        const double number = parseWithin(option, text);
        if constexpr (std::is_integral_v<Number> ||
                      std::is_same_v<Number, std::optional<int64_t>>) {
            value = static_cast<Number>(std::llround(number));
        } else {
            value = number;
        }
    };
    CLI::Option* const added = app.add_option_function<std::string>(option.name, parse, option.help)
                                   ->type_name(option.kind.placeholder);
    if (*option.byDefault != '\0') {
        parse(option.byDefault);
        added->default_str(option.byDefault);
    }
}

// The name stays empty if the option is not given.
void addLibraryOption(CLI::App& app, std::string& library);
