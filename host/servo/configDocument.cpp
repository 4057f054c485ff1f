#include "servo/configDocument.h"

#include "text/json.h"
#include "text/words.h"
#include "zvckmservo/parameters.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <string_view>
#include <strings.h>

namespace dravikHost {

namespace {

constexpr std::string_view kSetters = "dravik/tServo";
constexpr std::string_view kAccessor = "dravik/tJsonConfig";
constexpr int kNotJson = 29;
constexpr int kNoWholeNumber = 61;
constexpr int kNoNumber = 86;

bool isWhole(const zvckmservo_Parameter& key) { return key.kind != zvckmservo_kDouble; }

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

// The accessor names the kind of the value only: the first one of that kind that is not a number is
// the one that it met.
bool refused(const zvckmservo_Parameter& key, const cJSON* value, const tPlace& at)
{
    if (at.file == kSetters) return at.line == static_cast<int>(key.line);
    return at.file == kAccessor && cJSON_IsNumber(value) == 0 &&
           at.line == (isWhole(key) ? kNoWholeNumber : kNoNumber);
}

std::string wrongValueText(const zvckmservo_Parameter& key, const cJSON* value)
{
    if (cJSON_IsNumber(value) == 0)
        return fmt::format("{} is {}, which is not a number", key.key, jsonText(value));
    return fmt::format("{} is {}, not within {}{}{}", key.key, value->valuedouble, key.boundsText,
                       *key.unit == '\0' ? "" : " ", key.unit);
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

const zvckmservo_Parameter* keyNamed(const char* name)
{
    const zvckmservo_Parameter* const key =
        std::find_if(std::begin(zvckmservo_parameters), std::end(zvckmservo_parameters),
                     [name](const zvckmservo_Parameter& k) { return sameKey(k.key, name); });
    return key == std::end(zvckmservo_parameters) ? nullptr : key;
}

std::string unknownText(const char* name)
{
    std::vector<std::string> keys;
    for (const zvckmservo_Parameter& parameter : zvckmservo_parameters)
        keys.emplace_back(parameter.key);
    return fmt::format("{} is not a key and sets nothing{}", name, didYouMean(name, keys));
}

// "" if the value is taken as it looks.
std::string readingText(const zvckmservo_Parameter& key, const cJSON* value)
{
    if (!isWhole(key)) return "";
    const bool flag = key.kind == zvckmservo_kBool;
    const int read = value->valueint;
    const bool looksRight = value->valuedouble == read && (!flag || read == 0 || read == 1);
    if (looksRight) return "";
    const std::string meaning = !flag ? std::to_string(read) : read == 1 ? "1, on" : "off";
    return fmt::format("{} is {} and read as {}", key.key, value->valuedouble, meaning);
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
    for (const zvckmservo_Parameter& key : zvckmservo_parameters) {
        const cJSON* const value = cJSON_GetObjectItem(root.get(), key.key);
        if (value == nullptr) continue;
        if (refused(key, value, at)) {
            return fmt::format("{}; applied before it: {}", wrongValueText(key, value),
                               applied.empty() ? "nothing" : applied);
        }
        enumerate(applied, key.key);
    }
    return payload;
}

std::vector<std::string> documentNotes(const std::string& document)
{
    const tJson root = parseJson(document);
    if (cJSON_IsObject(root.get()) == 0) return {"it is not a JSON object, so it sets nothing"};
    std::vector<std::string> notes;
    const auto add = [&notes](const std::string& note) {
        if (!note.empty()) notes.push_back(note);
    };
    const cJSON* member = nullptr;
    cJSON_ArrayForEach(member, root.get())
    {
        const zvckmservo_Parameter* const key = keyNamed(member->string);
        if (key == nullptr) {
            add(unknownText(member->string));
        } else if (cJSON_GetObjectItem(root.get(), key->key) != member) {
            add(fmt::format("{} stands there twice, and the first one counts", key->key));
        } else {
            add(readingText(*key, member));
        }
    }
    if (hasMore(document)) add("what stands behind the object sets nothing");
    return notes;
}

} // namespace dravikHost
