#include "servo/configDocument.h"

#include "servo/json.h"

#include <fmt/format.h>

#include <algorithm>
#include <string_view>

namespace {

struct tKey {
    const char* name;
    bool whole;     // taken as a whole number
    int setterLine; // told when the value is out of its bounds; 0: there are none
    const char* bounds;
};

// In the order in which a document is applied.
constexpr tKey kKeys[] = {
    {"frequencyLockGain", false, 77, "1e-9 to 10"},
    {"phaseLockGain", false, 98, "1e-9 to 10"},
    {"phaseLockCoefficientA", false, 119, "-10 to 10"},
    {"phaseLockCoefficientB", false, 140, "-10 to 10"},
    {"phaseLockCoefficientC", false, 161, "-10 to 10"},
    {"snapTimeThreshold", false, 182, "1e-8 to 10 s"},
    {"spikeFilterEnabled", true, 0, ""},
    {"spikeFilterHistorySize", true, 235, "2 to 100"},
    {"spikeFilterMaxThreshold", false, 256, "1e-9 to 10 s/s"},
    {"spikeFilterMinThreshold", false, 277, "1e-9 to 10 s/s"},
    {"spikeFilterGrowthFactor", false, 298, "1.001 to 100"},
};

constexpr std::string_view kSetters = "dravik/tServo";
constexpr std::string_view kAccessor = "dravik/tJsonConfig";
constexpr int kNotJson = 29;
constexpr int kNoWholeNumber = 61;
constexpr int kNoNumber = 86;

struct tPlace {
    std::string file;
    int line = 0;
};

tPlace placeOf(const std::string& payload)
{
    const tJson details = parseJson(payload);
    const char* const file = cJSON_GetStringValue(cJSON_GetObjectItem(details.get(), "file"));
    const cJSON* const line = cJSON_GetObjectItem(details.get(), "line");
    if (file == nullptr || !cJSON_IsNumber(line)) return {};
    return {file, line->valueint};
}

// The accessor tells the kind of the value only: the first one of that kind that is no number is
// the one that it met.
bool refused(const tKey& key, const cJSON* value, const tPlace& at)
{
    if (at.file == kSetters) return at.line == key.setterLine;
    return at.file == kAccessor && cJSON_IsNumber(value) == 0 &&
           at.line == (key.whole ? kNoWholeNumber : kNoNumber);
}

std::string wrongValueText(const tKey& key, const cJSON* value)
{
    if (cJSON_IsNumber(value) == 0)
        return fmt::format("{} is {}, which is no number", key.name, jsonText(value));
    return fmt::format("{} is {}, not within {}", key.name, value->valuedouble, key.bounds);
}

std::string notJsonText(const std::string& document)
{
    const char* const text = document.c_str();
    const char* end = text;
    const tJson none(cJSON_ParseWithOpts(text, &end, 0));
    return fmt::format("it is not JSON, as of line {}", 1 + std::count(text, end, '\n'));
}

bool setsSomething(const cJSON* document, const cJSON* member)
{
    return std::any_of(std::begin(kKeys), std::end(kKeys), [=](const tKey& key) {
        return cJSON_GetObjectItem(document, key.name) == member;
    });
}

void enumerate(std::string& list, const char* name)
{
    list += fmt::format("{}{}", list.empty() ? "" : ", ", name);
}

} // namespace

std::string refusalText(const std::string& document, const std::string& payload)
{
    const tPlace at = placeOf(payload);
    if (at.file == kAccessor && at.line == kNotJson) return notJsonText(document);
    const tJson root = parseJson(document);
    std::string applied;
    for (const tKey& key : kKeys) {
        const cJSON* const value = cJSON_GetObjectItem(root.get(), key.name);
        if (value == nullptr) continue;
        if (refused(key, value, at)) {
            return fmt::format("{}; applied before it: {}", wrongValueText(key, value),
                               applied.empty() ? "nothing" : applied);
        }
        enumerate(applied, key.name);
    }
    return payload;
}

std::string ignoredText(const std::string& document)
{
    const tJson root = parseJson(document);
    if (cJSON_IsObject(root.get()) == 0) return "no JSON object, so nothing is set";
    std::string ignored;
    const cJSON* member = nullptr;
    cJSON_ArrayForEach(member, root.get())
    {
        if (!setsSomething(root.get(), member)) enumerate(ignored, member->string);
    }
    return ignored.empty() ? "" : "ignored: " + ignored;
}
