#pragma once

#include <cstdint>

// Finds and reads single values of a JSON text. Nothing is indexed: to find a member, everything in
// front of it is parsed.

// The closing bracket of the object or array at the text's first byte. Null if the text begins
// otherwise or does not parse; what follows the bracket is not looked at.
const char* jsonz_closingBracket(const char* text);

// The value of the first member of that name in the object that the text is; null if there is none.
// Only the top level counts, and what follows the value is not checked.
const char* jsonz_findMember(const char* text, const char* key);

// The value at `valueText` if it is a string: it points into the text, still escaped and `*length`
// characters long. Otherwise, and for a null text, `fallback` (which may be null) and its length.
// `next`, if given, is the place behind the value, null with the fallback.
const char* jsonz_getString(const char* valueText, const char* fallback, uint32_t* length,
                            const char** next);

// The value at `valueText` if it is a number: a fraction is cut off, and out of range the nearer
// limit is given. A leading 0 reads as octal. Otherwise, and for a null text, `fallback`.
int32_t jsonz_getInt(const char* valueText, int32_t fallback, const char** next);
