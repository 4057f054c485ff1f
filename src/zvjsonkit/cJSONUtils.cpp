#include "zvjsonkit/cJSONUtils.h"

#include "zverr/Exception.h"

#include <memory>
#include <new>

namespace zvjsonkit::cJSONUtils {

bool isNull(const cJSON* item) { return item->type == cJSON_NULL; }

bool isString(const cJSON* item) { return item->type == cJSON_String; }

bool isObject(const cJSON* item) { return item->type == cJSON_Object; }

void assertObject(const cJSON* item)
{
    if (!isObject(item)) zverr::raise(zverr::kAtAssertObject);
}

void assertString(const cJSON* item)
{
    if (!isString(item)) zverr::raise(zverr::kAtAssertString);
}

std::string getString(const cJSON* item)
{
    assertString(item);
    return item->valuestring;
}

std::string printUnformatted(const cJSON* item)
{
    const std::unique_ptr<char, decltype(&cJSON_free)> text(cJSON_PrintUnformatted(item),
                                                            cJSON_free);
    if (text == nullptr) throw std::bad_alloc();
    return text.get();
}

} // namespace zvjsonkit::cJSONUtils
