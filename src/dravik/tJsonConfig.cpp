#include "dravik/tJsonConfig.h"

#include "dravik/numberText.h"
#include "zverr/Exception.h"

#include <cmath>
#include <cstring>
#include <memory>
#include <stdexcept>

namespace zvckmDravik {

namespace {

bool isNumber(const cJSON* item) { return item->type == cJSON_Number; }

const cJSON* findNumber(const cJSON* root, const char* key, const zverr_RaisingSite& missing,
                        const zverr_RaisingSite& noNumber)
{
    const cJSON* const item = cJSON_GetObjectItem(root, key);
    if (item == nullptr) zverr::raise(missing);
    if (!isNumber(item)) zverr::raise(noNumber);
    return item;
}

void setNumber(cJSON* root, const char* key, double value, const zverr_RaisingSite& noNumber)
{
    cJSON* const item = cJSON_GetObjectItem(root, key);
    if (item == nullptr) {
        const cJSON* const added = cJSON_AddNumberToObject(root, key, value);
        if (added == nullptr) zverr::raise(zverr::kAtNewDocument);
    } else if (isNumber(item)) {
        cJSON_SetNumberHelper(item, value);
    } else {
        zverr::raise(noNumber);
    }
}

template <class Buffer> Buffer* require(Buffer* buffer)
{
    if (buffer == nullptr) throw std::logic_error("no memory to print the configuration");
    return buffer;
}

// Makes the numbers of a tree verbatim texts: the printer's own are rounded where a longer text is
// needed to read back the same.
void spellNumbers(cJSON* item)
{
    if (isNumber(item) && std::isfinite(item->valuedouble)) {
        const std::string text = numberText(item->valuedouble);
        item->valuestring = static_cast<char*>(require(cJSON_malloc(text.size() + 1)));
        std::memcpy(item->valuestring, text.c_str(), text.size() + 1);
        item->type = cJSON_Raw;
    }
    for (cJSON* child = item->child; child != nullptr; child = child->next) {
        spellNumbers(child);
    }
}

} // namespace

tJsonConfig::tJsonConfig() : root(cJSON_CreateObject())
{
    if (root == nullptr) zverr::raise(zverr::kAtNewDocument);
}

tJsonConfig::tJsonConfig(const std::string& jsonText) : root(cJSON_Parse(jsonText.c_str()))
{
    if (root == nullptr) zverr::raise(zverr::kAtParseDocument);
}

bool tJsonConfig::hasKey(const char* key) const
{
    return cJSON_GetObjectItem(root, key) != nullptr;
}

int32_t tJsonConfig::getInteger(const char* key) const
{
    return findNumber(root, key, zverr::kAtNoInteger, zverr::kAtBadInteger)->valueint;
}

bool tJsonConfig::getBool(const char* key) const { return getInteger(key) == 1; }

double tJsonConfig::getDouble(const char* key) const
{
    return findNumber(root, key, zverr::kAtNoDouble, zverr::kAtBadDouble)->valuedouble;
}

void tJsonConfig::setInteger(const char* key, uint32_t value)
{
    setNumber(root, key, value, zverr::kAtSetInteger);
}

void tJsonConfig::setBool(const char* key, bool value) { setInteger(key, value ? 1 : 0); }

void tJsonConfig::setDouble(const char* key, double value)
{
    setNumber(root, key, value, zverr::kAtSetDouble);
}

std::string tJsonConfig::toString() const
{
    using tTree = std::unique_ptr<cJSON, decltype(&cJSON_Delete)>;
    using tText = std::unique_ptr<char, decltype(&cJSON_free)>;
    const tTree copy(require(cJSON_Duplicate(root, true)), cJSON_Delete);
    spellNumbers(copy.get());
    const tText text(require(cJSON_Print(copy.get())), cJSON_free);
    return text.get();
}

} // namespace zvckmDravik
