#pragma once

#include "text/quantity.h"

#include <cmath>
#include <functional>
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

// The library that reads command lines; only commandLine.cpp sees all of it.
namespace CLI {
class App;
class Option;
} // namespace CLI

namespace dravikHost {

// An option or an argument that was added, for what is seldom asked of one.
class tOption
{
public:
    explicit tOption(CLI::Option* option) : option(option) {}

    tOption& require();
    tOption& showDefault(); // in the help: the value that it has now
    tOption& excludes(const tOption& other);
    tOption& needs(const tOption& other);
    tOption& oneOf(const std::vector<std::string>& values);

private:
    CLI::Option* option;
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

// In the base unit of the kind; throws std::invalid_argument.
double parseWithin(const tQuantityOption& option, const std::string& text);

// The options of one verb. Their values are borrowed until the command line has been read.
class tOptionSet
{
public:
    using tTake = std::function<void(const std::string& text)>; // std::invalid_argument refuses it

    explicit tOptionSet(CLI::App& app) : app(app) {}

    tOption flag(const char* name, bool& value, const char* help);
    tOption text(const char* name, const char* placeholder, std::string& value, const char* help);
    tOption text(const char* name, const char* placeholder, std::optional<std::string>& value,
                 const char* help);
    tOption texts(const char* name, const char* placeholder, std::vector<std::string>& values,
                  const char* help); // an argument, which takes all that is left
    tOption parsed(const char* name, const char* placeholder, const tTake& take, const char* help,
                   const std::string& byDefault = "");
    tOption repeatable(const char* name, const char* placeholder, const tTake& take,
                       const char* help);

    template <typename Number> tOption quantity(Number& value, const tQuantityOption& option)
    {
        const auto assign = [&value](double number) {
            if constexpr (std::is_integral_v<Number> ||
                          std::is_same_v<Number, std::optional<int64_t>>) {
                value = static_cast<Number>(std::llround(number));
            } else {
                value = number;
            }
        };
        return quantityOf(option, assign);
    }

    // Where the plug-in is; the name stays empty if the option is not given.
    void library(std::string& file);

    // Once all options have their values: std::invalid_argument refuses them together.
    void finally(const std::function<void()>& check);
    bool given(const char* name) const;

private:
    tOption quantityOf(const tQuantityOption& option, const std::function<void(double)>& assign);

    CLI::App& app;
};

// One word of the command line. Adds its options, and returns what it does with them.
struct tVerb {
    const char* name;
    const char* help;
    std::function<void()> (*add)(tOptionSet& options);
};

// Reads the command line, runs the verb that it names and returns the exit status of the program.
int runCommandLine(int argc, char** argv, const std::vector<tVerb>& verbs);

} // namespace dravikHost
