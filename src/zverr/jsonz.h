#pragma once

#include <cstdint>

// Status texts are edited in place, in a buffer that ends in a mark: text, one zero byte, zero
// bytes up to the last byte, and there `J`. The mark lets the room left be found from the text,
// so a writer needs no size: jsonzWriter.h adds members, jsonzParser.h and jsonzLookup.h read.
// None of it allocates or keeps state.

constexpr char kJsonzEndMark = 'J';

// Bytes that a buffer needs beyond its text: the zero byte and the end mark.
constexpr uint32_t kJsonzOverhead = 2;

// Fills the whole buffer with text, zero bytes and end mark. `size` is at least the length of the
// text plus kJsonzOverhead; `text` lies outside the buffer.
void jsonz_formatBuffer(char* buffer, uint32_t size, const char* text);

// What counts as white space between the parts of a text.
inline bool jsonz_isWhiteSpace(char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }
inline const char* jsonz_skipWhiteSpace(const char* text)
{
    while (jsonz_isWhiteSpace(*text)) {
        ++text;
    }
    return text;
}
