#pragma once

#include "metrics/tMeasured.h"

#include <optional>
#include <string>
#include <vector>

namespace dravikHost {

// A figure by its name: rms, peak, peak-to-peak, mean, time-to-lock, locks-lost, and with a tau in
// parentheses adev, oadev, mdev, tdev, mtie.
struct tFigure {
    std::string name;
    double tau = 0;      // s
    bool isTime = false; // in s; else a plain number
};

// Throws std::invalid_argument for what is no figure.
tFigure parseFigure(const std::string& text);

// Nothing if the data do not tell.
std::optional<double> valueOf(const tFigure& figure, const tMeasured& measured);

// What a trace has to hold, such as "rms<20ns" or "tdev(10s)<=1us".
class tAssertion
{
public:
    // Throws std::invalid_argument.
    explicit tAssertion(const std::string& text);

    // Returns why it does not hold, "" if it does.
    std::string failure(const tMeasured& measured) const;

private:
    std::string text;
    tFigure figure;
    bool less = true;
    bool orEqual = false;
    double limit = 0; // s, or a plain number
};

} // namespace dravikHost
