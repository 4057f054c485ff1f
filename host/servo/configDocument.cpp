#include "servo/configDocument.h"

#include "text/json.h"

#include <fmt/format.h>

#include <algorithm>
#include <cctype>
#include <cstring>
#include <numeric>
#include <string_view>
#include <strings.h>

namespace dravikHost {

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

// Letters of either case count as the same, as they do for the plug-in.
bool sameKey(const char* one, const char* other) { return strcasecmp(one, other) == 0; }

const tKey* keyNamed(const char* name)
{
    const tKey* const key = std::find_if(std::begin(kKeys), std::end(kKeys),
                                         [name](const tKey& k) { return sameKey(k.name, name); });
    return key == std::end(kKeys) ? nullptr : key;
}

// Letters to insert, leave out or replace to make one word of the other.
size_t distance(std::string_view one, std::string_view other)
{
    std::vector<size_t> row(other.size() + 1);
    std::iota(row.begin(), row.end(), size_t{0});
    for (size_t i = 0; i < one.size(); ++i) {
        size_t diagonal = row[0];
        row[0] = i + 1;
        for (size_t j = 0; j < other.size(); ++j) {
            const bool same = std::tolower(one[i]) == std::tolower(other[j]);
            const size_t replaced = diagonal + (same ? 0 : 1);
            diagonal = row[j + 1];
            row[j + 1] = std::min({replaced, row[j] + 1, row[j + 1] + 1});
        }
    }
    return row.back();
}

std::string unknownText(const char* name)
{
    const auto nearest = std::min_element(
        std::begin(kKeys), std::end(kKeys), [name](const tKey& one, const tKey& other) {
            return distance(name, one.name) < distance(name, other.name);
        });
    const bool near = distance(name, nearest->name) <= std::strlen(nearest->name) / 3;
    return fmt::format("{} is no key and sets nothing{}", name,
                       near ? fmt::format("; {} is meant?", nearest->name) : "");
}

// "" if the value is taken as it looks.
std::string readingText(const tKey& key, const cJSON* value)
{
    if (!key.whole) return "";
    const bool flag = key.setterLine == 0;
    const int read = value->valueint;
    const bool looksRight = value->valuedouble == read && (!flag || read == 0 || read == 1);
    if (looksRight) return "";
    const std::string meaning = !flag ? std::to_string(read) : read == 1 ? "1, on" : "off";
    return fmt::format("{} is {} and read as {}", key.name, value->valuedouble, meaning);
}

// What stands behind the JSON value, but for white space.
bool hasMore(const std::string& document)
{
    const char* end = nullptr;
    const tJson root(cJSON_ParseWithOpts(document.c_str(), &end, 0));
    return root != nullptr && end[std::strspn(end, " \t\r\n")] != '\0';
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

std::vector<std::string> documentNotes(const std::string& document)
{
    const tJson root = parseJson(document);
    if (cJSON_IsObject(root.get()) == 0) return {"it is no JSON object, so it sets nothing"};
    std::vector<std::string> notes;
    const auto add = [&notes](const std::string& note) {
        if (!note.empty()) notes.push_back(note);
    };
    const cJSON* member = nullptr;
    cJSON_ArrayForEach(member, root.get())
    {
        const tKey* const key = keyNamed(member->string);
        if (key == nullptr) {
            add(unknownText(member->string));
        } else if (cJSON_GetObjectItem(root.get(), key->name) != member) {
            add(fmt::format("{} stands there twice, and the first one counts", key->name));
        } else {
            add(readingText(*key, member));
        }
    }
    if (hasMore(document)) add("what stands behind the object sets nothing");
    return notes;
}

} // namespace dravikHost
