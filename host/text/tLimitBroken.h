#pragma once

#include <stdexcept>

// All went well, but what was found is not what was asked for. Ends the program with a status of
// its own.
class tLimitBroken : public std::runtime_error
{
    using std::runtime_error::runtime_error;
};
