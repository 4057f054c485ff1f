#pragma once

#include "loop/tRunningFigures.h"
#include "loop/tStep.h"

#include <optional>

namespace dravikHost {

// A clock whose reference is silent runs on at the frequency that it mostly had, and its error
// grows with what that frequency was unsure by.
class tHoldoverEstimate
{
public:
    void add(const tStep& step);

    // By how far the clock may be off after so long, one deviation; nothing if it has not been
    // locked for long enough to know.
    std::optional<double> errorNs(int64_t lengthNs) const;

private:
    static constexpr int64_t kWindow = 64; // pairs that show how sure the frequency is
    static constexpr int64_t kLeast = 8;   // fewer do not

    tRunningFigures window;   // being filled
    tRunningFigures previous; // full
};

} // namespace dravikHost
