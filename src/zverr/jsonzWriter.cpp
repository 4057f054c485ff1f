#include "zverr/jsonzWriter.h"

#include "zverr/jsonz.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

namespace {

constexpr size_t kScratchSize = 64; // for the digits of a number
constexpr unsigned char kDelete = 0x7F;
constexpr uint32_t kLongestEscape = 6;
constexpr char kHexDigits[] = "0123456789abcdef";

// The character behind the backslash, for those that have a short escape; else 0.
char shortEscape(unsigned char c)
{
    switch (c) {
    case '\b':
        return 'b';
    case '\t':
        return 't';
    case '\n':
        return 'n';
    case '\f':
        return 'f';
    case '\r':
        return 'r';
    case '"':
    case '\\':
        return static_cast<char>(c);
    default:
        return 0;
    }
}

uint32_t escapedLengthOf(unsigned char c)
{
    if (shortEscape(c) != 0) return 2;
    return c < ' ' || c == kDelete ? kLongestEscape : 1;
}

char* copyEscapedCharacter(char* out, unsigned char c)
{
    const uint32_t length = escapedLengthOf(c);
    if (length == 1) {
        *out = static_cast<char>(c);
    } else if (length == 2) {
        out[0] = '\\';
        out[1] = shortEscape(c);
    } else {
        const char escape[kLongestEscape] = {
            '\\', 'u', '0', '0', kHexDigits[c >> 4], kHexDigits[c & 0xF]};
        std::memcpy(out, escape, kLongestEscape);
    }
    return out + length;
}

// True if the bracket at `closing` has only white space between it and its opening bracket.
bool closesEmptyContainer(const char* closing)
{
    const char* p = closing - 1;
    while (jsonz_isWhiteSpace(*p)) {
        --p;
    }
    return *p == (*closing == '}' ? '{' : '[');
}

bool needsComma(const char* position)
{
    if (*position == '}' || *position == ']') return !closesEmptyContainer(position);
    return *position != 0;
}

// True if at least `room` zero bytes stand between the text's terminator and the end mark.
bool hasRoom(const char* terminator, uint64_t room)
{
    const char* const first = terminator + 1;
    uint64_t free = 0;
    while (free < room && first[free] == 0) {
        ++free;
    }
    return free == room;
}

// As jsonz_openGap, for a length that was counted and may be beyond any buffer's size.
char* openGapFor(char* position, uint64_t length)
{
    // unreached: beyond, as a test would need 4 GB
    return length <= UINT32_MAX ? jsonz_openGap(position, static_cast<uint32_t>(length)) : nullptr;
}

// A value that needs no quotes.
char* putBare(char* position, const char* key, const char* value)
{
    const size_t length = std::strlen(value);
    char* const gap = openGapFor(position, jsonz_keyLength(key) + length);
    if (gap == nullptr) return nullptr;
    return std::copy_n(value, length, jsonz_putKey(gap, key));
}

// Tries `put` at the position, and at the same place in an ever larger buffer, until it succeeds.
template <class Put> char* putGrowing(char* position, const jsonz_Grower* grower, Put put)
{
    while (position != nullptr) {
        char* const behind = put(position);
        if (behind != nullptr) return behind;
        if (grower->grow == nullptr) return nullptr;
        position = grower->grow(position, grower->context);
    }
    return nullptr;
}

} // namespace

uint64_t jsonz_escapedLength(const char* text)
{
    uint64_t length = 0;
    for (; *text != 0; ++text) {
        length += escapedLengthOf(static_cast<unsigned char>(*text));
    }
    return length;
}

uint64_t jsonz_keyLength(const char* key)
{
    return key != nullptr ? jsonz_escapedLength(key) + 3 : 0;
}

char* jsonz_copyEscaped(char* out, const char* text)
{
    for (; *text != 0; ++text) {
        out = copyEscapedCharacter(out, static_cast<unsigned char>(*text));
    }
    return out;
}

char* jsonz_putKey(char* out, const char* key)
{
    if (key == nullptr) return out;
    *out++ = '"';
    out = jsonz_copyEscaped(out, key);
    *out++ = '"';
    *out++ = ':';
    return out;
}

char* jsonz_openGap(char* position, uint32_t room)
{
    const bool inFront = *position == '{' || *position == '[';
    char* const gap = inFront ? position + 1 : position;
    // In front of an empty container's white space the member is alone as well.
    const char* const next = inFront ? jsonz_skipWhiteSpace(gap) : gap;
    const bool comma = needsComma(next);
    const uint64_t width = uint64_t{room} + (comma ? 1 : 0);

    char* const terminator = gap + std::strlen(gap);
    if (!hasRoom(terminator, width)) return nullptr;
    std::memmove(gap + width, gap, static_cast<size_t>(terminator - gap) + 1);

    if (!comma) return gap;
    if (inFront) {
        gap[room] = ',';
        return gap;
    }
    *gap = ',';
    return gap + 1;
}

char* jsonz_putString(char* position, const char* key, const char* value)
{
    const uint64_t length = jsonz_keyLength(key) + jsonz_escapedLength(value) + 2;
    char* const gap = openGapFor(position, length);
    if (gap == nullptr) return nullptr;
    char* out = jsonz_putKey(gap, key);
    *out++ = '"';
    out = jsonz_copyEscaped(out, value);
    *out++ = '"';
    return out;
}

char* jsonz_putInt(char* position, const char* key, int32_t value)
{
    char digits[kScratchSize];
    (void)std::snprintf(digits, sizeof digits, "%i", value);
    return putBare(position, key, digits);
}

char* jsonz_putUInt(char* position, const char* key, uint32_t value)
{
    char digits[kScratchSize];
    (void)std::snprintf(digits, sizeof digits, "%u", value);
    return putBare(position, key, digits);
}

char* jsonz_putObject(char* position, const char* key) { return putBare(position, key, "{}"); }

char* jsonz_addString(char* position, const char* key, const char* value,
                      const jsonz_Grower* grower)
{
    return putGrowing(position, grower,
                      [&](char* place) { return jsonz_putString(place, key, value); });
}

char* jsonz_addString(char* position, const char* key, const std::string& value,
                      const jsonz_Grower* grower)
{
    return jsonz_addString(position, key, value.c_str(), grower);
}

char* jsonz_addInt(char* position, const char* key, int32_t value, const jsonz_Grower* grower)
{
    return putGrowing(position, grower,
                      [&](char* place) { return jsonz_putInt(place, key, value); });
}

char* jsonz_addUInt(char* position, const char* key, uint32_t value, const jsonz_Grower* grower)
{
    return putGrowing(position, grower,
                      [&](char* place) { return jsonz_putUInt(place, key, value); });
}

char* jsonz_addObject(char* position, const char* key, const jsonz_Grower* grower)
{
    char* const behind =
        putGrowing(position, grower, [&](char* place) { return jsonz_putObject(place, key); });
    return behind != nullptr ? behind - 1 : nullptr;
}

char* jsonz_endObject(char* position) { return position != nullptr ? position + 1 : nullptr; }
