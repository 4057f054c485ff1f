#include "zverr/jsonzParser.h"

#include "zverr/jsonz.h"
#include "zverr/jsonzString.h"

#include <cstring>

// One parser for each kind of value. Each takes the text and gives the place behind its value or
// null, and looks no further: what must follow is the container's business.

namespace {

// `depth` counts the containers around the value.
using tParseFn = const char* (*)(const char* text, jsonz_Token* token, uint32_t depth);

const char* parseValue(const char* text, jsonz_Token* token, uint32_t depth);

const char* fail(jsonz_Token* token, jsonz_Error error, const char* place)
{
    if (token != nullptr) *token = {jsonz_tokenError, place, error, 0};
    return nullptr;
}

bool isDigit(char c) { return c >= '0' && c <= '9'; }

const char* skipDigits(const char* p)
{
    while (isDigit(*p)) {
        ++p;
    }
    return p;
}

const char* parseString(const char* text, jsonz_Token* token, uint32_t /*depth*/)
{
    if (*text != '"') return fail(token, jsonz_errorDoubleQuoteExpected, text);
    const char* const start = text + 1;
    const char* p = start;
    while (*p != '"') {
        if (static_cast<unsigned char>(*p) < ' ') { // the terminator too
            return fail(token, jsonz_errorDoubleQuoteExpected, p);
        }
        if (*p++ != '\\') continue;
        if (*p == 'u') {
            const uint32_t digits = jsonz_countHexDigits(++p);
            p += digits;
            if (digits < kJsonzHexDigits) return fail(token, jsonz_errorInvalidStringSequence, p);
        } else {
            if (jsonz_escapedByLetter(*p) == 0) {
                return fail(token, jsonz_errorInvalidStringSequence, p);
            }
            ++p;
        }
    }
    if (token != nullptr) {
        *token = {jsonz_tokenString, start, static_cast<uint32_t>(p - start), 0};
    }
    return p + 1;
}

const char* parseNumber(const char* text, jsonz_Token* token, uint32_t /*depth*/)
{
    if (*text != '-' && !isDigit(*text)) return nullptr;
    bool isFloat = false;
    const char* p = skipDigits(text + 1);
    if (*p == '.') {
        p = skipDigits(p + 1);
        isFloat = true;
    }
    if (*p == 'e' || *p == 'E') {
        ++p;
        if (*p != '+' && *p != '-' && !isDigit(*p)) return nullptr;
        p = skipDigits(p + 1);
        isFloat = true;
    }
    if (token != nullptr) {
        *token = {jsonz_tokenNumber, text, static_cast<uint32_t>(p - text),
                  static_cast<uint8_t>(isFloat)};
    }
    return p;
}

struct tContainer {
    char opening;
    char closing;
    bool hasKeys;
    jsonz_TokenType type;
    jsonz_Error bracketExpected;
};

constexpr tContainer kObject = {'{', '}', true, jsonz_tokenObject, jsonz_errorCurlyBracketExpected};
constexpr tContainer kArray = {'[', ']', false, jsonz_tokenArray, jsonz_errorSquareBracketExpected};

// From the first member to the closing bracket.
const char* parseMembers(const tContainer& container, const char* p, jsonz_Token* token,
                         uint32_t depth)
{
    for (;;) {
        if (container.hasKeys) p = jsonz_parseKey(p, token);
        if (p != nullptr) p = parseValue(p, token, depth);
        if (p == nullptr) return nullptr;
        p = jsonz_skipWhiteSpace(p);
        if (*p == container.closing) return p;
        if (*p == 0) return fail(token, container.bracketExpected, p);
        if (*p != ',') return fail(token, jsonz_errorCommaExpected, p);
        p = jsonz_skipWhiteSpace(p + 1);
        if (*p == container.closing) return fail(token, jsonz_errorTrailingComma, p);
    }
}

const char* parseContainer(const tContainer& container, const char* text, jsonz_Token* token,
                           uint32_t depth)
{
    if (*text != container.opening || depth == kJsonzDeepestNesting) {
        return fail(token, container.bracketExpected, text);
    }
    const char* p = jsonz_skipWhiteSpace(text + 1);
    if (*p == 0) return fail(token, container.bracketExpected, p);
    if (*p != container.closing) p = parseMembers(container, p, token, depth + 1);
    if (p == nullptr) return nullptr;
    if (token != nullptr) *token = {container.type, text, 0, 0};
    return p + 1;
}

const char* parseObject(const char* text, jsonz_Token* token, uint32_t depth)
{
    return parseContainer(kObject, text, token, depth);
}

const char* parseArray(const char* text, jsonz_Token* token, uint32_t depth)
{
    return parseContainer(kArray, text, token, depth);
}

// The place behind `word` if the text begins with it.
const char* skipWord(const char* text, const char* word)
{
    const size_t length = std::strlen(word);
    return std::strncmp(text, word, length) == 0 ? text + length : nullptr;
}

const char* parseBoolean(const char* text, jsonz_Token* token, uint32_t /*depth*/)
{
    const char* const behindTrue = skipWord(text, "true");
    const char* const behind = behindTrue != nullptr ? behindTrue : skipWord(text, "false");
    if (behind != nullptr && token != nullptr) {
        *token = {jsonz_tokenBool, nullptr, 0, 0};
        const unsigned char value = behind == behindTrue ? 1 : 0;
        std::memcpy(&token->start, &value, sizeof value);
    }
    return behind;
}

const char* parseNull(const char* text, jsonz_Token* token, uint32_t /*depth*/)
{
    const char* const behind = skipWord(text, "null");
    if (behind != nullptr && token != nullptr) *token = {jsonz_tokenNull, text, 0, 0};
    return behind;
}

constexpr tParseFn kParsers[] = {parseString, parseNumber,  parseObject,
                                 parseArray,  parseBoolean, parseNull};

// If no parser succeeds, the error furthest into the text is told, which is the one that comes from
// inside a value and not from its first character; of errors at one place, the first.
const char* parseValue(const char* text, jsonz_Token* token, uint32_t depth)
{
    jsonz_Token furthest = {};
    for (const tParseFn parse : kParsers) {
        jsonz_Token attempt = {jsonz_tokenNull, nullptr, 0, 0}; // left so where no error is told
        const char* const behind = parse(text, token != nullptr ? &attempt : nullptr, depth);
        if (behind != nullptr) {
            if (token != nullptr) *token = attempt;
            return behind;
        }
        if (attempt.type != jsonz_tokenError) continue;
        if (furthest.start == nullptr || attempt.start > furthest.start) furthest = attempt;
    }
    if (token != nullptr) *token = furthest;
    return nullptr;
}

} // namespace

const char* jsonz_parseValue(const char* text, jsonz_Token* token)
{
    return parseValue(text, token, 0);
}

const char* jsonz_parseValueAt(const char* text, jsonz_Token* token)
{
    if (text == nullptr) return fail(token, jsonz_errorValueExpected, text);
    return parseValue(jsonz_skipWhiteSpace(text), token, 0);
}

const char* jsonz_parseKey(const char* text, jsonz_Token* token)
{
    const char* const behind = parseString(text, token, 0);
    if (behind == nullptr) return nullptr;
    const char* const colon = jsonz_skipWhiteSpace(behind);
    if (*colon != ':') return fail(token, jsonz_errorColonExpected, colon);
    return jsonz_skipWhiteSpace(colon + 1);
}
