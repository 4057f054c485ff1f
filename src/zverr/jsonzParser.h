#pragma once

#include <cstddef>
#include <cstdint>

// Checks a JSON text in place and finds where its values begin and end. Numbers are taken more
// widely than JSON does: `-`, `1.`, `1e+` and `007` count.

// How deep objects and arrays may be nested, the value that is parsed counted. What is nested
// deeper does not parse: no text may exhaust the stack. Each level is one recursion, 120 bytes of
// stack on a 32-bit target and 170 on a 64-bit one in a release build, so the deepest takes some
// 160 KB.
constexpr uint32_t kJsonzDeepestNesting = 1000;

enum jsonz_TokenType : uint32_t {
    jsonz_tokenError = 0,
    jsonz_tokenNull = 1,
    jsonz_tokenBool = 2,
    jsonz_tokenNumber = 3,
    jsonz_tokenString = 4,
    jsonz_tokenArray = 5,
    jsonz_tokenObject = 6
};

enum jsonz_Error : uint32_t {
    jsonz_errorValueExpected = 1, // the text pointer is null
    // A string does not begin with a quote, holds a control character or is not closed. Also what
    // is told of a text that begins none of the six kinds of values, or is nested too deep.
    jsonz_errorDoubleQuoteExpected = 2,
    jsonz_errorCurlyBracketExpected = 3,  // no `{`, or the text ends inside an object
    jsonz_errorSquareBracketExpected = 4, // no `[`, or the text ends inside an array
    jsonz_errorColonExpected = 5,         // behind a key
    jsonz_errorCommaExpected = 6,         // behind a value, or a closing bracket
    jsonz_errorInvalidStringSequence = 7, // a bad escape
    jsonz_errorTrailingComma = 8,         // a closing bracket follows a comma
    jsonz_errorTrailingChar = 9           // reserved
};

struct jsonz_Token {
    uint32_t type; // jsonz_TokenType
    // First character of the value; of a string, the character behind the opening quote. In an
    // error, its place. In a boolean, the first byte of this field holds 1 or 0 instead.
    const char* start;
    // Characters of a number, or of a string between its quotes, still escaped; 0 for the other
    // kinds. In an error, the jsonz_Error.
    uint32_t length;
    uint8_t isFloat; // of a number: 1 if it has a fraction part or an exponent
};

static_assert(offsetof(jsonz_Token, start) == sizeof(void*), "the type comes first");
static_assert(offsetof(jsonz_Token, length) == 2 * sizeof(void*), "length behind one pointer");
static_assert(offsetof(jsonz_Token, isFloat) == 2 * sizeof(void*) + 4, "isFloat comes last");
static_assert(sizeof(jsonz_Token) == 2 * sizeof(void*) + 8, "nothing else in the token");

// All of these give the position behind what they parsed, or null if it does not parse, and
// describe it in the token. A null token: the text is only checked.

// The value at the first byte of the text.
const char* jsonz_parseValue(const char* text, jsonz_Token* token);
// The same behind white space; a null text is an error.
const char* jsonz_parseValueAt(const char* text, jsonz_Token* token);
// A key and its colon. The result is the first character of its value.
const char* jsonz_parseKey(const char* text, jsonz_Token* token);
