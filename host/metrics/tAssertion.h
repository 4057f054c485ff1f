#pragma once

#include "metrics/figures.h"

#include <string>

// What a trace has to hold, such as "rms<20ns" or "tdev(10s)<=1us".
class tAssertion
{
public:
    // Throws std::invalid_argument.
    explicit tAssertion(const std::string& assertion);

    // Returns why it does not hold, "" if it does.
    std::string failure(const tMeasured& measured) const;

private:
    std::string text;
    tFigure figure;
    bool less = true;
    bool orEqual = false;
    double limit = 0; // s, or a plain number
};
