#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

// Adds members to a JSON text in a buffer of the form told in jsonz.h, without knowing its size:
// the tail of the text moves up and the new characters go into the gap, with the comma that they
// need.
//
// A position stands on a closing bracket, a comma, an opening bracket or the terminator of the
// text, and a closing bracket has its opening bracket in front of it in the same buffer. A member
// is in completely or not at all; null as a result means that nothing was changed. A null key adds
// a bare value, as an array takes it.

// Enlarges the buffer and gives the same place in it, or null if it cannot grow. Every call that
// does not give null has made the buffer larger.
using jsonz_GrowFn = char* (*)(char* position, void* context);

struct jsonz_Grower {
    jsonz_GrowFn grow; // may be null: the buffer stays as it is
    void* context;
};

static_assert(offsetof(jsonz_Grower, context) == sizeof(void*), "the function comes first");

// The characters that a text takes once escaped, quotes not counted.
uint64_t jsonz_escapedLength(const char* text);
// The same for a key, with its two quotes and the colon; 0 for null.
uint64_t jsonz_keyLength(const char* key);
// Write without a terminator and return the end: the escaped text; `"key":`, nothing for null.
char* jsonz_copyEscaped(char* out, const char* text);
char* jsonz_putKey(char* out, const char* key);

// Makes a gap of `room` bytes at the position, and adds the comma that a member there needs.
// Returns where the member is to be written, which must fill the gap; null if there is no room.
char* jsonz_openGap(char* position, uint32_t room);

// One attempt with the room that there is. The result stands behind the member.
char* jsonz_putString(char* position, const char* key, const char* value);
char* jsonz_putInt(char* position, const char* key, int32_t value);
char* jsonz_putUInt(char* position, const char* key, uint32_t value);
char* jsonz_putObject(char* position, const char* key); // an empty one

// As above, but grow the buffer until the member fits; a null position stays null. The result of
// jsonz_addObject stands on the new object's closing brace, so that its members come next.
char* jsonz_addString(char* position, const char* key, const char* value,
                      const jsonz_Grower* grower);
char* jsonz_addString(char* position, const char* key, const std::string& value,
                      const jsonz_Grower* grower);
char* jsonz_addInt(char* position, const char* key, int32_t value, const jsonz_Grower* grower);
char* jsonz_addUInt(char* position, const char* key, uint32_t value, const jsonz_Grower* grower);
char* jsonz_addObject(char* position, const char* key, const jsonz_Grower* grower);

// From an object's closing brace to the place behind it; null stays null.
char* jsonz_endObject(char* position);
