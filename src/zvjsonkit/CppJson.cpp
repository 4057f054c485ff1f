#include "zvjsonkit/CppJson.h"

#include "zverr/Exception.h"

namespace zvjsonkit {

CppJson::CppJson(const char* jsonText) : root(cJSON_Parse(jsonText))
{
    if (root == nullptr) zverr::raise(zverr::kAtCppJson);
}

void CppJson::reset(cJSON* newRoot)
{
    cJSON_Delete(root);
    root = newRoot;
}

} // namespace zvjsonkit
