#pragma once

#include <cjson/cJSON.h>

namespace zvjsonkit {

// A parsed JSON document that owns its tree.
class CppJson
{
public:
    // Text behind the first JSON value does not count. Raises jsonErrorsInvalidJSON, for a lack of
    // memory too.
    explicit CppJson(const char* jsonText);
    ~CppJson() { reset(nullptr); }
    CppJson(const CppJson&) = delete;
    CppJson& operator=(const CppJson&) = delete;

    // Lets the present tree go and owns this one.
    void reset(cJSON* newRoot);
    cJSON* get() { return root; } // stays owned by the document

private:
    cJSON* root; // not null after construction
};

} // namespace zvjsonkit
