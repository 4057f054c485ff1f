#pragma once

#include "clocks/iClock.h"
#include "servo/tServoLibrary.h"
#include "sources/iPairSource.h"
#include "text/options.h"

#include <string>

// The loop that such verbs share: tunes the servo and hands each pair of the source to the plug-in,
// which disciplines the clock, and reports what happens. Throws std::runtime_error at the first
// failure, once all that led to it is in the CSV file.
//   scenario  one line for people, without its end
void discipline(const tServoLibrary& library, iClock& clock, iPairSource& source,
                const std::string& scenario, const tCommonOptions& options);
