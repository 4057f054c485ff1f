#include "zverr/jsonzLookup.h"

#include "zverr/jsonz.h"
#include "zverr/jsonzParser.h"
#include "zverr/jsonzString.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

constexpr size_t kScratchSize = 64;

// Out of range the nearer limit, on every machine. Number text never reads as not-a-number.
template <class Number> int32_t toInt32(Number number)
{
    const Number lowest = INT32_MIN;
    const Number highest = INT32_MAX;
    return static_cast<int32_t>(std::clamp(number, lowest, highest));
}

bool localeHasDecimalComma()
{
    char sample[kScratchSize];
    (void)std::snprintf(sample, sizeof sample, "%.1f", 1.5);
    return sample[1] == ',';
}

// Reads on from the number's first character, as scanf's "%i" does, and so further than the parser
// for text such as `0x10`, which is no JSON: the parser's number is the 0, the result is 16.
bool convertInteger(const char* start, int32_t* value)
{
    char* end = nullptr;
    const long long number = std::strtoll(start, &end, 0);
    *value = toInt32(number);
    return end != start;
}

// As scanf's "%lg". It wants the decimal point of the process's locale; where that is a comma, it
// gets a copy of the number, whose first characters decide.
bool convertFloat(const jsonz_Token& number, int32_t* value)
{
    char copy[kScratchSize];
    const char* start = number.start;
    if (localeHasDecimalComma()) {
        const size_t length = std::min<size_t>(number.length, sizeof copy - 1);
        std::memcpy(copy, number.start, length);
        copy[length] = 0;
        char* const point = std::strchr(copy, '.');
        if (point != nullptr) *point = ',';
        start = copy;
    }
    char* end = nullptr;
    *value = toInt32(std::strtod(start, &end));
    return end != start;
}

} // namespace

const char* jsonz_closingBracket(const char* text)
{
    if (*text != '{' && *text != '[') return nullptr;
    const char* const behind = jsonz_parseValue(text, nullptr);
    return behind != nullptr ? behind - 1 : nullptr;
}

const char* jsonz_findMember(const char* text, const char* key)
{
    const char* p = jsonz_skipWhiteSpace(text);
    if (*p != '{') return nullptr;
    do {
        p = jsonz_skipWhiteSpace(p + 1); // behind the bracket or the comma
        jsonz_Token name;
        const char* const value = jsonz_parseKey(p, &name);
        if (value == nullptr) return nullptr;
        if (jsonz_equalsEscaped(key, name.start, name.length)) return value;
        p = jsonz_parseValue(value, nullptr);
        if (p == nullptr) return nullptr;
        p = jsonz_skipWhiteSpace(p);
    } while (*p == ',');
    return nullptr;
}

const char* jsonz_getString(const char* valueText, const char* fallback, uint32_t* length,
                            const char** next)
{
    jsonz_Token token;
    const char* const behind = jsonz_parseValueAt(valueText, &token);
    const bool isString = behind != nullptr && token.type == jsonz_tokenString;
    if (next != nullptr) *next = isString ? behind : nullptr;
    if (isString) {
        *length = token.length;
        return token.start;
    }
    *length = fallback != nullptr ? static_cast<uint32_t>(std::strlen(fallback)) : 0;
    return fallback;
}

int32_t jsonz_getInt(const char* valueText, int32_t fallback, const char** next)
{
    jsonz_Token token;
    const char* const behind = jsonz_parseValueAt(valueText, &token);
    int32_t value = 0;
    const bool converts =
        behind != nullptr && token.type == jsonz_tokenNumber &&
        (token.isFloat != 0 ? convertFloat(token, &value) : convertInteger(token.start, &value));
    if (next != nullptr) *next = converts ? behind : nullptr;
    return converts ? value : fallback;
}
