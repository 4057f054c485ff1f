#include "servo/tServoParameters.h"

#include "text/json.h"

#include <fmt/format.h>

#include <stdexcept>

namespace dravikHost {

namespace {

// In the order of the table.
constexpr double tServoParameters::*kMembers[] = {
#define DRAVIK_POINTER(key, Key, Kind, line, lowest, highest, initial, unit, meaning)              \
    &tServoParameters::key,
    ZVCKMSERVO_PARAMETERS(DRAVIK_POINTER)
#undef DRAVIK_POINTER
};

} // namespace

std::string tServoParameters::documentText() const
{
    constexpr int kDigits = 6;
    constexpr int kDigitsOfA = 12; // A - B may be a small part of A
    tJsonObject document;
    for (size_t i = 0; i < zvckmservo_kParameterCount; ++i) {
        const int digits = i == zvckmservo_kPhaseLockCoefficientA ? kDigitsOfA : kDigits;
        document.add(zvckmservo_parameters[i].key,
                     fmt::format("{:.{}g}", this->*kMembers[i], digits));
    }
    return document.lines();
}

std::string tServoParameters::exactText() const
{
    tJsonObject document;
    for (size_t i = 0; i < zvckmservo_kParameterCount; ++i)
        document.add(zvckmservo_parameters[i].key, this->*kMembers[i]);
    return document.line();
}

tServoParameters tServoParameters::of(const std::string& document)
{
    const tJson root = parseJson(document);
    tServoParameters parameters;
    for (size_t i = 0; i < zvckmservo_kParameterCount; ++i) {
        const char* const key = zvckmservo_parameters[i].key;
        const cJSON* const value = cJSON_GetObjectItem(root.get(), key);
        if (cJSON_IsNumber(value) == 0)
            throw std::runtime_error(fmt::format("the plug-in's document has no {}", key));
        parameters.*kMembers[i] = value->valuedouble;
    }
    return parameters;
}

} // namespace dravikHost
