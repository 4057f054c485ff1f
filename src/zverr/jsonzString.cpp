#include "zverr/jsonzString.h"

namespace {

constexpr uint32_t kFirstSurrogate = 0xD800;
constexpr uint32_t kLastSurrogate = 0xDFFF;
constexpr uint32_t kEndOfCodePoints = 0x200000; // first that four bytes do not hold

bool isSurrogate(uint32_t value) { return value >= kFirstSurrogate && value <= kLastSurrogate; }

// The value of a hexadecimal digit, 16 for anything else.
uint32_t hexValue(char c)
{
    if (c >= '0' && c <= '9') return static_cast<uint32_t>(c - '0');
    if (c >= 'a' && c <= 'f') return static_cast<uint32_t>(c - 'a' + 10);
    if (c >= 'A' && c <= 'F') return static_cast<uint32_t>(c - 'A' + 10);
    return 16;
}

void skip(jsonz_StringReader* reader, uint32_t count)
{
    reader->cursor += count;
    reader->remaining -= count;
}

// Reads four hexadecimal digits; false if they are not there.
bool readHex(jsonz_StringReader* reader, uint32_t* value)
{
    if (reader->remaining < kJsonzHexDigits) return false;
    if (jsonz_countHexDigits(reader->cursor) < kJsonzHexDigits) return false;
    *value = 0;
    for (uint32_t i = 0; i < kJsonzHexDigits; ++i) {
        *value = *value * 16 + hexValue(reader->cursor[i]);
    }
    skip(reader, kJsonzHexDigits);
    return true;
}

// The second half of a pair, with its own `\u`. Neither half is checked for being the right one.
bool readSecondHalf(jsonz_StringReader* reader, uint32_t* codePoint)
{
    if (reader->remaining < 2 || reader->cursor[0] != '\\' || reader->cursor[1] != 'u')
        return false;
    skip(reader, 2);
    uint32_t second = 0;
    if (!readHex(reader, &second)) return false;
    *codePoint = ((*codePoint + 0x2800) & 0xFFFF) * 1024 + ((second + 0x2400) & 0xFFFF) + 0x10000;
    return true;
}

// The code point as UTF-8, the first byte lowest.
uint32_t utf8Of(uint32_t codePoint)
{
    const auto continuation = [codePoint](uint32_t shift) {
        return 0x80 | (codePoint >> shift & 0x3F);
    };
    if (codePoint < 0x80) return codePoint;
    if (codePoint < 0x800) return 0xC0 | codePoint >> 6 | continuation(0) << 8;
    if (codePoint < 0x10000) {
        return 0xE0 | codePoint >> 12 | continuation(6) << 8 | continuation(0) << 16;
    }
    return 0xF0 | codePoint >> 18 | continuation(12) << 8 | continuation(6) << 16 |
           continuation(0) << 24;
}

// Behind `\u`: false where the reading ends.
bool readCodePoint(jsonz_StringReader* reader)
{
    uint32_t codePoint = 0;
    if (!readHex(reader, &codePoint)) return false;
    if (isSurrogate(codePoint) && !readSecondHalf(reader, &codePoint)) return false;
    if (codePoint >= kEndOfCodePoints) return false;
    reader->pending = utf8Of(codePoint);
    return true;
}

char takePending(jsonz_StringReader* reader)
{
    const char byte = static_cast<char>(reader->pending & 0xFF);
    reader->pending >>= 8;
    return byte;
}

} // namespace

uint32_t jsonz_countHexDigits(const char* text)
{
    uint32_t count = 0;
    while (count < kJsonzHexDigits && hexValue(text[count]) < 16) {
        ++count;
    }
    return count;
}

char jsonz_escapedByLetter(char letter)
{
    switch (letter) {
    case '"':
    case '/':
    case '\\':
        return letter;
    case 'b':
        return '\b';
    case 'f':
        return '\f';
    case 'n':
        return '\n';
    case 'r':
        return '\r';
    case 't':
        return '\t';
    default:
        return 0;
    }
}

char jsonz_readerNext(jsonz_StringReader* reader)
{
    if (reader->pending != 0) return takePending(reader);
    if (reader->remaining == 0) {
        reader->cursor = nullptr;
        return 0;
    }
    const char c = *reader->cursor;
    if (c != '\\') {
        skip(reader, 1);
        return c;
    }
    if (reader->remaining == 1) return 0;
    const char letter = reader->cursor[1];
    if (letter == 'u') {
        skip(reader, 2);
        return readCodePoint(reader) ? takePending(reader) : '\0';
    }
    const char byte = jsonz_escapedByLetter(letter);
    if (byte != 0) skip(reader, 2);
    return byte;
}

bool jsonz_equalsEscaped(const char* plain, const char* text, uint32_t length)
{
    jsonz_StringReader reader = {0, length, text};
    for (;; ++plain) {
        const char c = jsonz_readerNext(&reader);
        if (c != *plain) return false;
        if (c == 0) return true;
    }
}

char* jsonz_unescape(const char* text, uint32_t length, char* out)
{
    jsonz_StringReader reader = {0, length, text};
    char c = jsonz_readerNext(&reader);
    for (; c != 0; c = jsonz_readerNext(&reader)) {
        *out++ = c;
    }
    *out = 0;
    return reader.cursor == nullptr ? out : nullptr;
}
