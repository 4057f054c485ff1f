#include "verbs/commandLine.h"

#include "text/words.h"
#include "verbs/tHelpLines.h"
#include "verbs/verbs.h"

#include <CLI/CLI.hpp>
#include <fmt/format.h>

#include <cstdio>
#include <exception>
#include <memory>
#include <stdexcept>

namespace dravikHost {

namespace {

enum tExitStatus { kGood = 0, kFailure = 1, kUsage = 2, kLimitBroken = 3 };

constexpr const char* kFooter =
    "Values have units: ns us ms s min h, ppb ppm, mHz Hz, dB, %.\n"
    "Files may be -, the standard input or output.\n"
    "Exit status: 0 good; 1 a failure of the plug-in or of a file, such as a\n"
    "refused document; 2 wrong usage; 3 a limit of metrics is not held.";

std::string errorLine(const CLI::App* /*app*/, const CLI::Error& error)
{
    return std::string("dravik-host: ") + error.what() + "\n";
}

// What refuses a value becomes an error of its option, by its long name.
void takeOrRefuse(const std::string& names, const tOptionSet::tTake& take, const std::string& text)
{
    try {
        take(text);
    } catch (const std::invalid_argument& failure) {
        throw CLI::ValidationError(names.substr(names.find(',') + 1), failure.what());
    }
}

int misspelt(const CLI::App& app, const std::vector<tVerb>& verbs)
{
    const auto chosen = app.get_subcommands();
    const CLI::App& verb = chosen.empty() ? app : *chosen.front();
    const std::vector<std::string> extras = app.remaining(true);
    const std::string word =
        extras.empty() ? "" : extras.front().substr(0, extras.front().find('='));
    std::vector<std::string> known;
    for (const CLI::Option* const option : verb.get_options())
        known.push_back(option->get_name());
    if (chosen.empty()) {
        for (const tVerb& each : verbs)
            known.emplace_back(each.name);
    }
    const char* const kind = word.front() == '-' ? "option" : chosen.empty() ? "verb" : "argument";
    (void)std::fprintf(stderr, "dravik-host: unknown %s %s%s\n", kind, word.c_str(),
                       didYouMean(word, known).c_str());
    return kUsage;
}

int parseAndRun(int argc, char** argv, const std::vector<tVerb>& verbs)
{
    CLI::App app("Reference host of the clock servo plug-in", "dravik-host");
    app.formatter(std::make_shared<tHelpLines>());
    app.set_version_flag("--version", "dravik-host " DRAVIK_VERSION, "Print the version and exit");
    app.require_subcommand(0, 1);
    app.failure_message(errorLine);
    app.footer(kFooter);
    std::function<void()> chosen;
    for (const tVerb& verb : verbs) {
        CLI::App* const sub = app.add_subcommand(verb.name, verb.help);
        tOptionSet options(*sub);
        sub->callback([run = verb.add(options), &chosen] { chosen = run; });
    }
    try {
        app.parse(argc, argv);
    } catch (const CLI::ExtrasError&) {
        return misspelt(app, verbs);
    } catch (const CLI::ParseError& outcome) { // help and version come this way too
        return app.exit(outcome) == 0 ? kGood : kUsage;
    }
    if (!chosen) {
        (void)std::fputs(app.help().c_str(), stderr);
        return kUsage;
    }
    chosen();
    return kGood;
}

int fail(const std::exception& failure, tExitStatus status)
{
    (void)std::fprintf(stderr, "dravik-host: %s\n", failure.what());
    return status;
}

} // namespace

tOption& tOption::require() { return option->required(), *this; }

tOption& tOption::showDefault() { return option->capture_default_str(), *this; }

tOption& tOption::excludes(const tOption& other) { return option->excludes(other.option), *this; }

tOption& tOption::needs(const tOption& other) { return option->needs(other.option), *this; }

tOption& tOption::oneOf(const std::vector<std::string>& values)
{
    return option->check(CLI::IsMember(values)), *this;
}

double parseWithin(const tQuantityOption& option, const std::string& text)
{
    const double value = parseQuantity(text, option.kind);
    if (value >= parseQuantity(option.lowest, option.kind) &&
        value <= parseQuantity(option.highest, option.kind))
        return value;
    throw std::invalid_argument(
        fmt::format("'{}' is not within {} to {}", text, option.lowest, option.highest));
}

tOption tOptionSet::flag(const char* name, bool& value, const char* help)
{
    return tOption(app.add_flag(name, value, help));
}

tOption tOptionSet::text(const char* name, const char* placeholder, std::string& value,
                         const char* help)
{
    return tOption(app.add_option(name, value, help)->type_name(placeholder));
}

tOption tOptionSet::text(const char* name, const char* placeholder,
                         std::optional<std::string>& value, const char* help)
{
    const auto assign = [&value](const std::string& text) { value = text; };
    return tOption(
        app.add_option_function<std::string>(name, assign, help)->type_name(placeholder));
}

tOption tOptionSet::texts(const char* name, const char* placeholder,
                          std::vector<std::string>& values, const char* help)
{
    return tOption(app.add_option(name, values, help)->type_name(placeholder));
}

tOption tOptionSet::parsed(const char* name, const char* placeholder, const tTake& take,
                           const char* help, const std::string& byDefault)
{
    const auto parse = [name, take](const std::string& text) { takeOrRefuse(name, take, text); };
    CLI::Option* const option =
        app.add_option_function<std::string>(name, parse, help)->type_name(placeholder);
    if (!byDefault.empty()) option->default_str(byDefault);
    return tOption(option);
}

tOption tOptionSet::repeatable(const char* name, const char* placeholder, const tTake& take,
                               const char* help)
{
    const auto parse = [name, take](const std::vector<std::string>& texts) {
        for (const std::string& text : texts)
            takeOrRefuse(name, take, text);
    };
    return tOption(app.add_option_function<std::vector<std::string>>(name, parse, help)
                       ->type_name(placeholder)
                       ->expected(1)
                       ->take_all());
}

tOption tOptionSet::quantityOf(const tQuantityOption& option,
                               const std::function<void(double)>& assign)
{
    const auto parse = [option, assign](const std::string& text) {
        assign(parseWithin(option, text));
    };
    if (*option.byDefault != '\0') parse(option.byDefault);
    return parsed(option.name, option.kind.placeholder, parse, option.help, option.byDefault);
}

void tOptionSet::library(std::string& file)
{
    text("--library", "FILE", file,
         "The plug-in; else $DRAVIK_LIBRARY, else\nlibdravik.so.1 beside this program or as "
         "installed");
}

void tOptionSet::finally(const std::function<void()>& check)
{
    app.parse_complete_callback([check] {
        try {
            check();
        } catch (const std::invalid_argument& failure) {
            throw CLI::ValidationError(failure.what());
        }
    });
}

bool tOptionSet::given(const char* name) const { return app.count(name) > 0; }

int runCommandLine(int argc, char** argv, const std::vector<tVerb>& verbs)
{
    try {
        return parseAndRun(argc, argv, verbs);
    } catch (const tLimitBroken& broken) {
        return fail(broken, kLimitBroken);
    } catch (const std::exception& failure) {
        return fail(failure, kFailure);
    }
}

} // namespace dravikHost
