#pragma once

#include <cjson/cJSON.h>

#include <string>

// Type tests and typed access to one item, which is not null. The whole type field counts, its
// flags too.

namespace zvjsonkit::cJSONUtils {

bool isNull(const cJSON* item);
bool isString(const cJSON* item);
bool isObject(const cJSON* item);

void assertObject(const cJSON* item); // raises jsonErrorsNotAnObject
void assertString(const cJSON* item); // raises jsonErrorsTypeMismatch

// The text of a string; raises jsonErrorsTypeMismatch.
std::string getString(const cJSON* item);
// The item as JSON without white space; raises std::bad_alloc.
std::string printUnformatted(const cJSON* item);

} // namespace zvjsonkit::cJSONUtils
