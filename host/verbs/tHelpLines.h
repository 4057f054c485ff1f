#pragma once

#include <CLI/CLI.hpp>

#include <string>

namespace dravikHost {

// The help in two columns that hold at 80 characters, whatever an option is called: names on the
// left; on the right what it means, then its values, its default and what it goes with.
class tHelpLines : public CLI::Formatter
{
public:
    std::string make_option(const CLI::Option* option, bool isPositional) const override;
    std::string make_subcommand(const CLI::App* verb) const override;
};

} // namespace dravikHost
