#include "text/json.h"

#include <fmt/format.h>

#include <new>

namespace dravikHost {

tJson parseJson(const std::string& text) { return tJson(cJSON_Parse(text.c_str())); }

std::string jsonText(const cJSON* value)
{
    struct tFree {
        void operator()(char* text) const { cJSON_free(text); }
    };
    const std::unique_ptr<char, tFree> text(cJSON_PrintUnformatted(value));
    if (text == nullptr) throw std::bad_alloc();
    return text.get();
}

std::string jsonQuoted(const std::string& text)
{
    return jsonText(tJson(cJSON_CreateStringReference(text.c_str())).get());
}

tJsonObject& tJsonObject::add(const std::string& key, const std::string& json)
{
    members.push_back(jsonQuoted(key) + ": " + json);
    return *this;
}

tJsonObject& tJsonObject::add(const std::string& key, double value)
{
    return add(key, fmt::format("{}", value));
}

tJsonObject& tJsonObject::add(const std::string& key, const std::optional<double>& value)
{
    return add(key, value ? fmt::format("{}", *value) : "null");
}

std::string tJsonObject::line() const { return fmt::format("{{{}}}", fmt::join(members, ", ")); }

std::string tJsonObject::lines() const
{
    return fmt::format("{{\n  {}\n}}\n", fmt::join(members, ",\n  "));
}

} // namespace dravikHost
