#include "servo/tServoParameters.h"

#include "text/json.h"

#include <fmt/format.h>

#include <stdexcept>

namespace dravikHost {

namespace {

struct tNumberKey {
    const char* name;
    double tServoParameters::*value;
};
struct tWholeKey {
    const char* name;
    int tServoParameters::*value;
};

constexpr tNumberKey kNumbers[] = {
    {"frequencyLockGain", &tServoParameters::frequencyLockGain},
    {"phaseLockGain", &tServoParameters::phaseLockGain},
    {"phaseLockCoefficientA", &tServoParameters::phaseLockCoefficientA},
    {"phaseLockCoefficientB", &tServoParameters::phaseLockCoefficientB},
    {"phaseLockCoefficientC", &tServoParameters::phaseLockCoefficientC},
    {"snapTimeThreshold", &tServoParameters::snapTimeThreshold},
    {"spikeFilterMaxThreshold", &tServoParameters::spikeFilterMaxThreshold},
    {"spikeFilterMinThreshold", &tServoParameters::spikeFilterMinThreshold},
    {"spikeFilterGrowthFactor", &tServoParameters::spikeFilterGrowthFactor},
};
constexpr tWholeKey kWholes[] = {
    {"spikeFilterEnabled", &tServoParameters::spikeFilterEnabled},
    {"spikeFilterHistorySize", &tServoParameters::spikeFilterHistorySize},
};

} // namespace

std::string tServoParameters::documentText() const
{
    tJsonObject document;
    for (const tNumberKey& key : kNumbers) {
        const bool isRatio = key.value == &tServoParameters::phaseLockCoefficientA;
        const int digits = isRatio ? 12 : 6; // A - B may be a small part of A
        document.add(key.name, fmt::format("{:.{}g}", this->*key.value, digits));
    }
    for (const tWholeKey& key : kWholes)
        document.add(key.name, std::to_string(this->*key.value));
    return document.lines();
}

tServoParameters tServoParameters::of(const std::string& document)
{
    const tJson root = parseJson(document);
    const auto number = [&root](const char* name) {
        const cJSON* const value = cJSON_GetObjectItem(root.get(), name);
        if (cJSON_IsNumber(value) == 0)
            throw std::runtime_error(fmt::format("the plug-in tells no {}", name));
        return value->valuedouble;
    };
    tServoParameters parameters;
    for (const tNumberKey& key : kNumbers)
        parameters.*key.value = number(key.name);
    for (const tWholeKey& key : kWholes)
        parameters.*key.value = static_cast<int>(number(key.name));
    return parameters;
}

} // namespace dravikHost
