#pragma once

#include <cjson/cJSON.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace dravikHost {

// A JSON value that is freed with its scope.
struct tJsonDelete {
    void operator()(cJSON* value) const { cJSON_Delete(value); }
};
using tJson = std::unique_ptr<cJSON, tJsonDelete>;

// Null if the text is not JSON.
tJson parseJson(const std::string& text);

// Compact. Throws std::bad_alloc.
std::string jsonText(const cJSON* value);

// The text as a JSON string, quoted and escaped. Throws std::bad_alloc.
std::string jsonQuoted(const std::string& text);

// Writes a JSON object, member by member, with numbers in the digits that they are given with.
class tJsonObject
{
public:
    // Values are JSON already: numbers, quoted texts, other objects.
    tJsonObject& add(const std::string& key, const std::string& json);
    tJsonObject& add(const std::string& key, double value); // the shortest digits that give it back
    tJsonObject& add(const std::string& key, const std::optional<double>& value); // else null

    std::string line() const;  // {"a": 1, "b": 2}
    std::string lines() const; // a line for each member, ending with the closing brace's

private:
    std::vector<std::string> members;
};

} // namespace dravikHost
