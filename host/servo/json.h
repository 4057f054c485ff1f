#pragma once

#include <cjson/cJSON.h>

#include <memory>
#include <string>

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
