#pragma once

#include <cjson/cJSON.h>

#include <cstdint>
#include <string>

namespace zvckmDravik {

// Typed access to the numbers of one JSON object. A key is found among the direct members without
// regard to case (by the process's LC_CTYPE), and the first match counts; a document that is no
// object has no keys. Every failure is raised, and a failed setter changes nothing. In a locale
// whose decimal point takes several bytes the parser refuses fractions.
class tJsonConfig
{
public:
    tJsonConfig(); // an empty object; raises zvplaterr_memoryFull
    // Text behind the first JSON value does not count. Raises zvplaterr_invalidParameter.
    explicit tJsonConfig(const std::string& jsonText);
    ~tJsonConfig() { cJSON_Delete(root); }
    tJsonConfig(const tJsonConfig&) = delete;
    tJsonConfig& operator=(const tJsonConfig&) = delete;

    bool hasKey(const char* key) const; // of whatever type

    // Raise zvplaterr_resourceNotFound for a missing key, zvplaterr_invalidParameter for a value
    // that is no number; a flag is a number too.
    int32_t getInteger(const char* key) const; // cut toward zero, at most the nearer limit
    bool getBool(const char* key) const;       // true for the integer 1 alone
    double getDouble(const char* key) const;

    // Replace a number in its place, or add one at the end. Raise zvplaterr_invalidParameter for a
    // member that is no number, zvplaterr_memoryFull if none can be added.
    void setInteger(const char* key, uint32_t value);
    void setBool(const char* key, bool value);
    void setDouble(const char* key, double value);

    // The document in formatted text, with a point in its numbers whatever the locale, each of them
    // as long as it takes to read back as the very same double. Raises std::logic_error for a lack
    // of memory.
    std::string toString() const;

private:
    cJSON* root; // never null
};

} // namespace zvckmDravik
