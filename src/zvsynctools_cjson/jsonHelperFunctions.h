#pragma once

#include <string>

// Look-ups of a member in a JSON text that may lack it. A member is one of the top level, found
// without regard to case; the first match counts. False if there is none, also because the text is
// no object; `value` is then left as it was, and so it is by a failure. A text that is not JSON
// raises jsonErrorsInvalidJSON.

namespace zvsynctools_cjson {

// A string member. A null counts as found and leaves `value`. Any other type raises
// jsonErrorsTypeMismatch with the text and the key in its payload.
bool getOptionalString(const std::string& jsonText, const std::string& key, std::string& value);

// The text of an object member, without white space. Any other type, null too, raises
// jsonErrorsNotAnObject.
bool getOptionalObjectText(const std::string& jsonText, const std::string& key, std::string& value);

} // namespace zvsynctools_cjson
