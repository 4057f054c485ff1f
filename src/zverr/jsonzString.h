#pragma once

#include <cstddef>
#include <cstdint>

// Strings of a JSON text, still escaped, given back as plain bytes without a copy of the whole.

constexpr uint32_t kJsonzHexDigits = 4; // behind `\u`

// Hexadecimal digits at the text's start, kJsonzHexDigits at most.
uint32_t jsonz_countHexDigits(const char* text);

// The byte that a backslash and this letter stand for; 0 if they are no escape. Not for `u`.
char jsonz_escapedByLetter(char letter);

// Walks the escaped text of a string byte by byte. Starts with `pending` 0.
struct jsonz_StringReader {
    uint32_t pending;   // up to four UTF-8 bytes still to be handed out, lowest byte first
    uint32_t remaining; // characters of escaped text left
    const char* cursor; // the next character; null at the clean end of the text
};

static_assert(offsetof(jsonz_StringReader, remaining) == 4, "pending comes first");
static_assert(offsetof(jsonz_StringReader, cursor) == 8, "cursor at byte 8");

// The next plain byte. 0 at the clean end, which makes `cursor` null, and at a bad escape, an
// escape that the end cuts, a lone surrogate and `\u0000`, which leave it.
char jsonz_readerNext(jsonz_StringReader* reader);

// True if `length` characters of escaped text stand for the plain string. Text behind a bad escape
// is not seen.
bool jsonz_equalsEscaped(const char* plain, const char* text, uint32_t length);

// Writes the plain bytes and a terminator, `length` + 1 bytes at most. Returns the terminator's
// place, or null if the text did not end cleanly; what stands in front of that is written.
char* jsonz_unescape(const char* text, uint32_t length, char* out);
