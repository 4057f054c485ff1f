#include "zvsynctools_cjson/jsonHelperFunctions.h"

#include "zverr/Exception.h"
#include "zverr/payload.h"
#include "zvjsonkit/CppJson.h"
#include "zvjsonkit/cJSONUtils.h"

namespace zvsynctools_cjson {

namespace {

namespace items = zvjsonkit::cJSONUtils;

bool getStringIfAny(const std::string& jsonText, const std::string& key, std::string& value)
{
    zvjsonkit::CppJson document(jsonText.c_str());
    const cJSON* const item = cJSON_GetObjectItem(document.get(), key.c_str());
    if (item == nullptr) return false;
    if (!items::isNull(item)) value = items::getString(item);
    return true;
}

[[noreturn]] void raiseTypeError(const std::string& jsonText, const std::string& key)
{
    zverr::Exception failure;
    zverr_setFailure(&failure.status, zverr::kAtGetOptionalString)
        .addObject("zvsync_debug")
        .addString("message", "Error parsing: expected data type does not match the parsed value.")
        .addString("JSON", jsonText)
        .addString("key", key)
        .endObject();
    throw failure;
}

} // namespace

bool getOptionalString(const std::string& jsonText, const std::string& key, std::string& value)
{
    try {
        return getStringIfAny(jsonText, key, value);
    } catch (const zverr::Exception& failure) {
        if (failure.status.code != jsonErrorsTypeMismatch) throw;
    }
    raiseTypeError(jsonText, key);
}

bool getOptionalObjectText(const std::string& jsonText, const std::string& key, std::string& value)
{
    zvjsonkit::CppJson document(jsonText.c_str());
    const cJSON* const item = cJSON_GetObjectItem(document.get(), key.c_str());
    if (item == nullptr) return false;
    items::assertObject(item);
    value = items::printUnformatted(item);
    return true;
}

} // namespace zvsynctools_cjson
