// The payload text: the writer, which edits it in place, and the reader.

#include "support/tHostStatus.h"
#include "zverr/jsonz.h"
#include "zverr/jsonzLookup.h"
#include "zverr/jsonzParser.h"
#include "zverr/jsonzString.h"
#include "zverr/jsonzWriter.h"

#include <clocale>
#include <cstring>
#include <functional>
#include <gtest/gtest.h>
#include <memory>
#include <string>

namespace {

// A text in a buffer of its own with so many bytes to spare, and not one more.
struct tBuffer {
    tBuffer(const std::string& text, size_t room)
        : capacity(text.size() + kJsonzOverhead + room), bytes(new char[capacity])
    {
        jsonz_formatBuffer(bytes.get(), static_cast<uint32_t>(capacity), text.c_str());
    }
    ~tBuffer() { expectBufferForm({0, static_cast<uint32_t>(capacity), nullptr, bytes.get()}); }
    std::string text() const { return bytes.get(); }

    size_t capacity;
    std::unique_ptr<char[]> bytes;
};

using tPut = std::function<char*(char* position)>;

tPut aString(const char* key, const char* value)
{
    return [=](char* position) { return jsonz_putString(position, key, value); };
}
tPut anInt(const char* key, int32_t value)
{
    return [=](char* position) { return jsonz_putInt(position, key, value); };
}
tPut aUInt(const char* key, uint32_t value)
{
    return [=](char* position) { return jsonz_putUInt(position, key, value); };
}
tPut anObject(const char* key)
{
    return [=](char* position) { return jsonz_putObject(position, key); };
}

TEST(JsonWriter, AddsAMemberIntoTheLastFreeByteAndNotBeyond)
{
    const struct {
        const char *name, *before;
        size_t position;
        tPut put;
        const char* after;
        size_t behind; // the position that comes back
    } rows[] = {
        {"first member", "{}", 1, aString("a", "b"), R"({"a":"b"})", 8},
        {"behind another", R"({"a":"b"})", 8, anInt("c", -1), R"({"a":"b","c":-1})", 15},
        {"behind white space", "{ \t\r\n}", 5, anInt("a", 1), "{ \t\r\n\"a\":1}", 10},
        {"other characters count", "{\f}", 2, anInt("a", 1), "{\f,\"a\":1}", 8},
        {"element", "[]", 1, aUInt(nullptr, UINT32_MAX), "[4294967295]", 11},
        {"next element", "[1 ]", 3, anInt(nullptr, INT32_MIN), "[1 ,-2147483648]", 15},
        {"wrong bracket", "[}", 1, anInt(nullptr, 1), "[,1}", 3},
        {"in front", R"({"a":1})", 0, anInt("b", 2), R"({"b":2,"a":1})", 6},
        {"in front of an element", "[1]", 0, anInt(nullptr, 2), "[2,1]", 2},
        {"in front of nothing", "{}", 0, anInt("b", 2), R"({"b":2})", 6},
        {"in front of a blank", "[ ]", 0, anInt(nullptr, 2), "[2 ]", 2},
        {"at a comma", "[1,2]", 2, aString(nullptr, ""), R"([1,"",2])", 5},
        {"at the end", "[1", 2, anInt(nullptr, 2), "[12", 3},
        {"inner object", R"({"o":{"k":1},"n":1})", 11, anObject("p"),
         R"({"o":{"k":1,"p":{}},"n":1})", 18},
        {"end marks in the text", R"({"J":"J"})", 8, aString("J", "J"), R"({"J":"J","J":"J"})", 16},
        {"escapes", "{}", 1, aString("\"", "\"\\\b\t\n\f\r\x01\x1f\x7f/ \xc3\xa9"),
         "{\"\\\"\":\"\\\"\\\\\\b\\t\\n\\f\\r\\u0001\\u001f\\u007f/ \xc3\xa9\"}", 44}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        const size_t need = std::strlen(row.after) - std::strlen(row.before);
        tBuffer exact(row.before, need);
        char* const behind = row.put(exact.bytes.get() + row.position);
        EXPECT_EQ(row.after, exact.text());
        EXPECT_EQ(row.behind, static_cast<size_t>(behind - exact.bytes.get()));
        tBuffer small(row.before, need - 1);
        EXPECT_EQ(nullptr, row.put(small.bytes.get() + row.position));
        EXPECT_EQ(row.before, small.text());
    }
    tBuffer full("{}", 0);
    const jsonz_Grower none = {nullptr, nullptr};
    EXPECT_EQ(nullptr, jsonz_addString(full.bytes.get() + 1, "a", "b", &none));
    tBuffer roomy("{}", 7);
    EXPECT_NE(nullptr, jsonz_addString(roomy.bytes.get() + 1, "a", "b", &none));
}

TEST(JsonReader, TellsWhereAndWhyATextDoesNotParse)
{
    const struct {
        const char* text;
        uint32_t error; // 0: parses up to `place`
        size_t place;
        // clang-format off
    } rows[] = {
        {R"({"a":1,})", 8, 7}, {"[1 , ]", 8, 5}, {R"({"a" 1})", 5, 5}, {R"({"a":1 "b":2})", 6, 7},
        {"[1 2]", 6, 3}, {"[1}", 6, 2}, {"[1,2", 4, 4}, {"[", 4, 1}, {"{", 3, 1},
        {R"({"a":1 )", 3, 7}, {R"({"a":"\q"})", 7, 7}, {R"("\u12g4")", 7, 5}, {R"("\)", 7, 2},
        {R"("\u)", 7, 3}, {R"({"a":"x)", 2, 7}, {"\"a\tb\"", 2, 2}, {"{1:2}", 2, 1},
        {R"({"a":})", 2, 5}, {R"({"a":1,)", 2, 7}, {"[x]", 2, 1}, {"", 2, 0},
        {" 1", 2, 0 /* white space is skipped inside only */}, {"+1", 2, 0}, {".5", 2, 0},
        {"1e", 2, 0}, {"nul", 2, 0}, {"{}x", 0, 2}, {"[ 1 , [ ] , { \"a\" : null } ]x", 0, 28},
        {"truest", 0, 4}, {"null", 0, 4}, {"\"\\\"\\/\\\\\\b\\f\\n\\r\\t\\uaF09 \x7f\x80\"", 0, 27}};
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.text);
        jsonz_Token token = {};
        const char* const behind = jsonz_parseValue(row.text, &token);
        EXPECT_EQ(behind, jsonz_parseValue(row.text, nullptr)) << "without a token it is the same";
        EXPECT_EQ(row.error == 0, token.type != jsonz_tokenError);
        EXPECT_EQ(row.text + row.place, row.error == 0 ? behind : token.start);
        EXPECT_EQ(row.error, row.error == 0 ? 0 : token.length);
        EXPECT_EQ(0, token.isFloat);
        const bool closes = row.error == 0 && (*row.text == '{' || *row.text == '[');
        EXPECT_EQ(closes ? behind - 1 : nullptr, jsonz_closingBracket(row.text));
    }
    jsonz_Token token = {};
    EXPECT_EQ(nullptr, jsonz_parseValueAt(nullptr, &token));
    EXPECT_EQ(1U, token.length);
    EXPECT_EQ(nullptr, jsonz_closingBracket(" {}"));
}

TEST(JsonReader, DescribesAValueOfEachKind)
{
    const struct {
        const char* text;
        uint32_t type;
        size_t start;
        uint32_t length;
        bool isFloat;
        // clang-format off
    } rows[] = {
        {R"( "a\n")", jsonz_tokenString, 2, 3, false}, {"\t-", jsonz_tokenNumber, 1, 1, false},
        {"007x", jsonz_tokenNumber, 0, 3, false}, {"1.", jsonz_tokenNumber, 0, 2, true},
        {"1e+", jsonz_tokenNumber, 0, 3, true}, {"-1.5E-07,", jsonz_tokenNumber, 0, 8, true},
        {"\r\n[1]", jsonz_tokenArray, 2, 0, false}, {R"({"a":1})", jsonz_tokenObject, 0, 0, false},
        {"null", jsonz_tokenNull, 0, 0, false}};
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.text);
        jsonz_Token token = {};
        ASSERT_NE(nullptr, jsonz_parseValueAt(row.text, &token));
        EXPECT_EQ(row.type, token.type);
        EXPECT_EQ(row.text + row.start, token.start);
        EXPECT_EQ(row.length, token.length);
        EXPECT_EQ(row.isFloat, token.isFloat != 0);
    }
    for (const char* text : {"true", "false"}) {
        jsonz_Token token = {};
        ASSERT_EQ(text + std::strlen(text), jsonz_parseValue(text, &token));
        EXPECT_EQ(jsonz_tokenBool, token.type);
        EXPECT_EQ(0U, token.length + token.isFloat);
        EXPECT_EQ(*text == 't' ? 1 : 0, reinterpret_cast<const unsigned char*>(&token.start)[0]);
    }
}

TEST(JsonReader, StopsAtItsDeepestNesting)
{
    for (const size_t depth : {1000U, 1001U, 1000000U}) {
        const std::string arrays = std::string(depth, '[') + std::string(depth, ']');
        EXPECT_EQ(depth <= 1000, jsonz_closingBracket(arrays.c_str()) != nullptr);
        EXPECT_EQ(depth <= 1000, jsonz_parseValueAt(arrays.c_str(), nullptr) != nullptr);
        std::string objects;
        for (size_t i = 0; i < depth; ++i) {
            objects += "{\"\":";
        }
        objects += "1" + std::string(depth, '}');
        EXPECT_EQ(depth <= 1000, jsonz_closingBracket(objects.c_str()) != nullptr);
    }
}

TEST(JsonReader, FindsTheFirstMemberOfTheTopLevel)
{
    const struct {
        const char *text, *key;
        const char* value; // and what follows; null: not found
        // clang-format off
    } rows[] = {
        {R"({"a":{"b":1},"b":2})", "b", "2}"}, {R"({"a":1,"a":2})", "a", R"(1,"a":2})"},
        {" {\t\"a\" :\n1 , \"b\" : 2", "b", "2"}, {R"({"\u0061\"\/":1})", "a\"/", "1}"},
        {R"({"ab":1})", "a", nullptr}, {R"({"a":1})", "ab", nullptr},
        {R"({"a":1 "b":2})", "b", nullptr}, {R"({"a":x,"b":2})", "b", nullptr},
        {R"({"a":1,})", "b", nullptr}, {R"([{"a":1}])", "a", nullptr}, {R"(["a":1])", "a", nullptr},
        {"{}", "a", nullptr}, {"", "a", nullptr}, {R"({"a":1}, "b":2)", "b", nullptr}};
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.text);
        EXPECT_STREQ(row.value, jsonz_findMember(row.text, row.key));
    }
}

TEST(JsonReader, GivesStringsThatPointIntoTheText)
{
    const char* const text = R"(  "a\n" ,)";
    uint32_t length = 9;
    const char* next = text;
    EXPECT_EQ(text + 3, jsonz_getString(text, "fallback", &length, &next));
    EXPECT_EQ(3U, length);
    EXPECT_EQ(text + 7, next);
    for (const char* other : {"12", "null", R"("open)", static_cast<const char*>(nullptr)}) {
        next = text;
        EXPECT_STREQ("fallback", jsonz_getString(other, "fallback", &length, &next));
        EXPECT_EQ(8U, length);
        EXPECT_EQ(nullptr, next);
        EXPECT_EQ(nullptr, jsonz_getString(other, nullptr, &length, nullptr));
        EXPECT_EQ(0U, length);
    }
}

TEST(JsonReader, ConvertsNumbersUnderEveryLocale)
{
    const struct {
        const char* text;
        int32_t value;
        int behind; // -1: the fallback
        // clang-format off
    } rows[] = {
        {"12", 12, 2}, {"-7,", -7, 2}, {" 12.9", 12, 5}, {"-12.9", -12, 5}, {"010", 8, 3},
        {"0x10", 16, 1 /* cut by the parser, read on by the conversion */}, {"08", 0, 2},
        {"1.5e3,7.5", 1500, 5}, {"1e2", 100, 3}, {"1e+", 1, 3}, {"1.", 1, 2}, {"-.5", 0, 3},
        {"2147483647", INT32_MAX, 10}, {"2147483648", INT32_MAX, 10},
        {"-2147483649", INT32_MIN, 11}, {"99999999999999999999", INT32_MAX, 20},
        {"4294967297", INT32_MAX, 10}, {"1e999", INT32_MAX, 5}, {"-3e9", INT32_MIN, 4},
        {"-2147483648.5", INT32_MIN, 13}, {"\"12\"", 55, -1}, {"-", 55, -1}, {"-e5", 55, -1},
        {"true", 55, -1}, {"x", 55, -1}, {nullptr, 55, -1}};
    // clang-format on
    for (const char* locale : {"C", "de_DE.UTF-8"}) {
        ASSERT_NE(nullptr, std::setlocale(LC_ALL, locale)) << locale;
        for (const auto& row : rows) {
            SCOPED_TRACE(testing::Message() << locale << " " << (row.text ? row.text : "null"));
            const char* next = "";
            EXPECT_EQ(row.value, jsonz_getInt(row.text, 55, &next));
            EXPECT_EQ(row.behind < 0 ? nullptr : row.text + row.behind, next);
            EXPECT_EQ(row.value, jsonz_getInt(row.text, 55, nullptr));
        }
        // As long as the copy that a decimal comma needs, and longer.
        EXPECT_EQ(100, jsonz_getInt(("1." + std::string(59, '0') + "e2").c_str(), 0, nullptr));
        EXPECT_EQ(1, jsonz_getInt(("1." + std::string(1000, '0')).c_str(), 0, nullptr));
    }
    (void)std::setlocale(LC_ALL, "C");
}

TEST(JsonReader, UnescapesUpToTheFirstBadSequence)
{
    for (const auto& [escaped, plain, clean] :
         {std::tuple<const char*, const char*, bool>{"", "", true},
          {"a\x7f\xc3\xa9", "a\x7f\xc3\xa9", true},
          {R"(\"\/\\\b\f\n\r\t)", "\"/\\\b\f\n\r\t", true},
          {R"(\u004A\u007f\u0080\u00e9\u07FF)", "J\x7f\xc2\x80\xc3\xa9\xdf\xbf", true},
          {R"(\u0800\ud7ff\ue000\uffff)", "\xe0\xa0\x80\xed\x9f\xbf\xee\x80\x80\xef\xbf\xbf", true},
          {R"(\u20ac)", "\xe2\x82\xac", true},
          {R"(\ud800\udc00\ud83d\ude00)", "\xf0\x90\x80\x80\xf0\x9f\x98\x80", true},
          {R"(\udbff\udfffx)", "\xf4\x8f\xbf\xbfx", true},
          // Halves in the wrong order are taken as they come, as far as four bytes hold them.
          {R"(\udc00\u1234x)", "\xf4\x93\x98\xb4x", true},
          {R"(\udfbf\udfff)", "\xf7\xbf\xbf\xbf", true},
          // clang-format off
          {R"(a\udfbf\ue000)", "a", false}, {R"(a\udfff\udc00)", "a", false},
          {R"(a\ud83d)", "a", false}, {R"(a\ud83dx)", "a", false}, {R"(a\ud83d\n)", "a", false},
          {R"(a\ud83dxude00)", "a", false}, {R"(a\ud83d\u12)", "a", false},
          {R"(a\ud83d\u12x4)", "a", false}, {R"(a\u0000b)", "a", false}, {R"(a\)", "a", false},
          {R"(a\qb)", "a", false}, {R"(a\u12)", "a", false}, {R"(a\u12:4)", "a", false}}) {
        // clang-format on
        SCOPED_TRACE(escaped);
        const auto length = static_cast<uint32_t>(std::strlen(escaped));
        const std::unique_ptr<char[]> out(new char[length + 1]);
        char* const end = jsonz_unescape(escaped, length, out.get());
        EXPECT_STREQ(plain, out.get());
        EXPECT_EQ(clean ? out.get() + std::strlen(plain) : nullptr, end);
        EXPECT_TRUE(jsonz_equalsEscaped(plain, escaped, length));
        EXPECT_FALSE(jsonz_equalsEscaped((plain + std::string("x")).c_str(), escaped, length));
    }
    // The length ends the reading, inside an escape too, whatever stands behind it.
    char out[8];
    EXPECT_NE(nullptr, jsonz_unescape("abc", 2, out));
    EXPECT_STREQ("ab", out);
    for (const uint32_t length : {1U, 2U, 5U, 6U, 7U, 11U}) {
        EXPECT_EQ(nullptr, jsonz_unescape(R"(\ud83d\ude00)", length, out)) << length;
        EXPECT_STREQ("", out) << length;
    }
}

} // namespace
