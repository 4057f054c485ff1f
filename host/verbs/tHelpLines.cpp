#include "verbs/tHelpLines.h"

#include <fmt/format.h>

#include <set>
#include <sstream>

namespace dravikHost {

namespace {

constexpr size_t kWidth = 80;
constexpr size_t kVerbColumn = 12;
constexpr size_t kOptionColumn = 34;

// Names that reach into the other column have a line of their own.
std::string columns(const std::string& names, const std::string& text, size_t column)
{
    std::string lines;
    std::string line = "  " + names;
    if (line.size() < column) {
        line.resize(column, ' ');
    } else {
        lines = line + "\n";
        line.assign(column, ' ');
    }
    std::istringstream words(text);
    for (std::string word; words >> word;) {
        const bool isFirst = line.size() == column;
        if (!isFirst && line.size() + 1 + word.size() > kWidth) {
            lines += line + "\n";
            line.assign(column, ' ');
        } else if (!isFirst) {
            line += ' ';
        }
        line += word;
    }
    return lines + line + "\n";
}

std::string namesOf(const std::set<CLI::Option*>& options)
{
    std::string names;
    for (const CLI::Option* const option : options)
        names += (names.empty() ? "" : ", ") + option->get_name();
    return names;
}

// The type tells the values, if only some are taken: NAME:{a,b}.
std::string valuesOf(const std::string& type)
{
    const size_t colon = type.find(":{");
    if (colon == std::string::npos) return "";
    std::string values;
    for (const char c : type.substr(colon + 2, type.size() - colon - 3))
        values += c == ',' ? std::string(", ") : std::string(1, c);
    return values;
}

std::string withNotes(const CLI::Option& option)
{
    const std::string values = valuesOf(option.get_type_name());
    std::string notes;
    const auto add = [&notes](const char* format, const std::string& value) {
        notes += (notes.empty() ? "" : "; ") + fmt::format(fmt::runtime(format), value);
    };
    if (!values.empty()) add("one of {}", values);
    if (!option.get_default_str().empty()) add("default {}", option.get_default_str());
    if (option.get_required()) add("required", "");
    if (!option.get_needs().empty()) add("needs {}", namesOf(option.get_needs()));
    if (!option.get_excludes().empty()) add("not with {}", namesOf(option.get_excludes()));
    return option.get_description() + (notes.empty() ? "" : " (" + notes + ")");
}

} // namespace

std::string tHelpLines::make_option(const CLI::Option* option, bool isPositional) const
{
    std::string names = make_option_name(option, isPositional);
    if (option->get_type_size() != 0) {
        const std::string type = option->get_type_name();
        names += " " + type.substr(0, type.find(':'));
    }
    if (option->get_expected_max() == CLI::detail::expected_max_vector_size) names += " ...";
    return columns(names, withNotes(*option), kOptionColumn);
}

std::string tHelpLines::make_subcommand(const CLI::App* verb) const
{
    return columns(verb->get_name(), verb->get_description(), kVerbColumn);
}

} // namespace dravikHost
