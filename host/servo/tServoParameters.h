#pragma once

#include "zvckmservo/parameters.h"

#include <algorithm>
#include <string>

namespace dravikHost {

// A value for each of the eleven parameters; in a new one those of a new servo.
struct tServoParameters {
#define DRAVIK_MEMBER(key, Key, Kind, line, lowest, highest, initial, unit, meaning)               \
    double key = initial;
    ZVCKMSERVO_PARAMETERS(DRAVIK_MEMBER)
#undef DRAVIK_MEMBER

    // A document with all of them, six digits each, a line for each key.
    std::string documentText() const;

    // As many digits as it takes to read the same values back.
    std::string exactText() const;

    // Of a document with all eleven keys, as the plug-in gives it out. Throws std::runtime_error.
    static tServoParameters of(const std::string& document);
};

// The nearest value that the parameter may have.
inline double withinBounds(zvckmservo_ParameterIndex parameter, double value)
{
    const zvckmservo_Parameter& bounds = zvckmservo_parameters[parameter];
    return std::clamp(value, bounds.lowest, bounds.highest);
}

} // namespace dravikHost
