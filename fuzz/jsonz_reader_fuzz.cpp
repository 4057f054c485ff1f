// Any bytes as a payload text. Nothing is read outside the text, checking and describing agree, and
// what parses takes a further member and parses still.

#include "require.h"
#include "zverr/jsonz.h"
#include "zverr/jsonzLookup.h"
#include "zverr/jsonzParser.h"
#include "zverr/jsonzString.h"
#include "zverr/jsonzWriter.h"

#include <cstring>
#include <vector>

namespace {

void readAsValue(const char* first)
{
    const char* const last = first + std::strlen(first);
    jsonz_Token token = {};
    const char* const behind = jsonz_parseValueAt(first, &token);
    REQUIRE(behind == jsonz_parseValueAt(first, nullptr));
    if (behind != nullptr) {
        REQUIRE(behind > first && behind <= last);
        REQUIRE(token.type != jsonz_tokenError);
    } else {
        REQUIRE(token.type == jsonz_tokenError);
        REQUIRE(token.start >= first && token.start <= last);
        REQUIRE(token.length >= jsonz_errorDoubleQuoteExpected);
        REQUIRE(token.length <= jsonz_errorTrailingComma);
    }
}

// A member's value as string and as number, whatever it is.
void readMember(const char* text, const char* key)
{
    const char* const value = jsonz_findMember(text, key);
    const char* next = nullptr;
    uint32_t length = 0;
    const char* const string = jsonz_getString(value, "", &length, &next);
    std::vector<char> plain(length + 1);
    const char* const end = jsonz_unescape(string, length, plain.data());
    if (end != nullptr) REQUIRE(jsonz_equalsEscaped(plain.data(), string, length));
    REQUIRE(std::strlen(plain.data()) <= length);
    jsonz_getInt(value, 0, &next);
}

void addAtTheEnd(const char* text)
{
    const char* const bracket = jsonz_closingBracket(text);
    if (bracket == nullptr) return;
    REQUIRE(*bracket == '}' || *bracket == ']');
    const char* const key = *bracket == '}' ? "added" : nullptr;
    const uint64_t room = jsonz_keyLength(key) + sizeof R"("x",)" - 1;
    std::vector<char> buffer(std::strlen(text) + kJsonzOverhead + room);
    jsonz_formatBuffer(buffer.data(), static_cast<uint32_t>(buffer.size()), text);
    const auto offset = bracket - text;
    const char* const behind = jsonz_putString(buffer.data() + offset, key, "x");
    REQUIRE(behind != nullptr);
    REQUIRE(jsonz_closingBracket(buffer.data()) == behind);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    // Up to the first zero byte, in an allocation of just that size.
    std::vector<char> bytes(data, data + size);
    bytes.push_back(0);
    const std::vector<char> text(bytes.data(), bytes.data() + std::strlen(bytes.data()) + 1);
    readAsValue(text.data());
    readMember(text.data(), "component");
    readMember(text.data(), "file");
    readMember(text.data(), "line");
    addAtTheEnd(text.data());
    return 0;
}
