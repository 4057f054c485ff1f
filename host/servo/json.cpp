#include "servo/json.h"

#include <new>

tJson parseJson(const std::string& text) { return tJson(cJSON_Parse(text.c_str())); }

std::string jsonText(const cJSON* value)
{
    const std::unique_ptr<char, decltype(&cJSON_free)> text(cJSON_PrintUnformatted(value),
                                                            cJSON_free);
    if (text == nullptr) throw std::bad_alloc();
    return text.get();
}

std::string jsonQuoted(const std::string& text)
{
    return jsonText(tJson(cJSON_CreateStringReference(text.c_str())).get());
}
