// The layers over cJSON: the accessor of the configuration document, and the look-ups in metadata.

#include "dravik/tJsonConfig.h"
#include "dravik/timeReferenceMetaData.h"
#include "support/raisedBy.h"
#include "zvsynctools_cjson/jsonHelperFunctions.h"

#include <gtest/gtest.h>

namespace {

using zvckmDravik::tJsonConfig;
using zvsynctools_cjson::getOptionalObjectText;
using zvsynctools_cjson::getOptionalString;

std::string payload(const std::string& code, const char* constant, const char* file, int line)
{
    return code + R"( {"error_constant":")" + constant + R"(","file":")" + file + R"(","line":)" +
           std::to_string(line) + R"(,"component":"dravik"})";
}

std::string invalidAt(int line)
{
    return payload("-52005", "zvplaterr_invalidParameter", "dravik/tJsonConfig", line);
}

std::string missingAt(int line)
{
    return payload("-52006", "zvplaterr_resourceNotFound", "dravik/tJsonConfig", line);
}

TEST(JsonConfig, ReadsNumbersAndNothingElse)
{
    const tJsonConfig config(R"({"big":1e10,"low":-1e10,"half":7.9,"minus":-7.9,"one":1.9,)"
                             R"("less":0.9,"two":2,"huge":1e999,"true":true,"null":null,)"
                             R"("Twice":"x","twice":1,"nested":{"deep":1}})");
    struct Row {
        const char* key;
        int32_t integer;
        bool flag;
    };
    for (const Row& row :
         {Row{"big", INT32_MAX, false}, Row{"low", INT32_MIN, false}, Row{"half", 7, false},
          Row{"minus", -7, false}, Row{"ONE", 1, true}, Row{"less", 0, false}, Row{"two", 2, false},
          Row{"huge", INT32_MAX, false}}) {
        SCOPED_TRACE(row.key);
        EXPECT_TRUE(config.hasKey(row.key));
        EXPECT_EQ(row.integer, config.getInteger(row.key));
        EXPECT_EQ(row.flag, config.getBool(row.key));
    }
    EXPECT_EQ(-7.9, config.getDouble("MINUS"));
    for (const char* other : {"true", "null", "twice", "nested"}) { // the first match counts
        SCOPED_TRACE(other);
        EXPECT_TRUE(config.hasKey(other));
        EXPECT_EQ(invalidAt(61), raisedBy([&] { config.getInteger(other); }));
        EXPECT_EQ(invalidAt(61), raisedBy([&] { config.getBool(other); }));
        EXPECT_EQ(invalidAt(86), raisedBy([&] { config.getDouble(other); }));
    }
    for (const char* text : {R"({"":1})", "[1]", "1 behind", "\"deep\"", "\xEF\xBB\xBF{}"}) {
        const tJsonConfig none(text);
        EXPECT_FALSE(none.hasKey("deep"));
        EXPECT_EQ(missingAt(56), raisedBy([&] { none.getInteger("deep"); }));
        EXPECT_EQ(missingAt(81), raisedBy([&] { none.getDouble("deep"); }));
    }
    for (const char* text : {"", " ", "{", "{\"a\":1,}", "\xEF\xBB\xBF", " \xEF\xBB\xBF{}"}) {
        EXPECT_EQ(invalidAt(29), raisedBy([&] { const tJsonConfig config(text); })) << text;
    }
}

TEST(JsonConfig, WritesNumbersInTheirPlace)
{
    tJsonConfig config(R"({"first":1,"text":"x","inner":[0.1,{"third":0.30000000000000004}]})");
    config.setDouble("FIRST", 0.55);
    config.setInteger("unsigned", UINT32_MAX);
    config.setBool("flag", true);
    config.setDouble("minus", -0.0);
    EXPECT_EQ(invalidAt(110), raisedBy([&] { config.setInteger("text", 1); }));
    EXPECT_EQ(invalidAt(110), raisedBy([&] { config.setBool("text", true); }));
    EXPECT_EQ(invalidAt(145), raisedBy([&] { config.setDouble("text", 1); }));
    EXPECT_EQ("{\n\t\"first\":\t0.55,\n\t\"text\":\t\"x\",\n\t\"inner\":\t[0.1, {\n"
              "\t\t\t\"third\":\t0.30000000000000004\n\t\t}],\n"
              "\t\"unsigned\":\t4294967295,\n\t\"flag\":\t1,\n\t\"minus\":\t-0\n}",
              config.toString());
    EXPECT_EQ(0.55, config.getDouble("first")) << "printing changes nothing";
    EXPECT_EQ("{\n\t\"x\":\tnull\n}", tJsonConfig(R"({"x":1e999})").toString());
    EXPECT_EQ("{\n}", tJsonConfig().toString());
}

TEST(JsonHelpers, LookUpOptionalMembers)
{
    const std::string type =
        R"(-52004 {"error_constant":"errCode",)"
        R"("file":"zvsynctools_cjson/jsonHelperFunctions","line":50,)"
        R"("component":"dravik","zvsync_debug":{"message":)"
        R"("Error parsing: expected data type does not match the parsed value.",)";
    const std::string invalid = payload("-52005", "jsonErrorsInvalidJSON", "zvjsonkit/CppJson", 34);
    const std::string noObject =
        payload("-52004", "jsonErrorsNotAnObject", "zvjsonkit/cJSONUtils", 78);
    const struct {
        bool (*lookUp)(const std::string&, const std::string&, std::string&);
        const char *text, *key;
        bool found;
        const char* value; // "old" before
        std::string raised;
    } rows[] = {{getOptionalString, R"({"a":"x\ny"} z)", "A", true, "x\ny", ""},
                {getOptionalString, R"({"a":null})", "a", true, "old", ""},
                {getOptionalString, R"({"b":{"a":""}})", "a", false, "old", ""},
                {getOptionalString, R"(["a"])", "a", false, "old", ""},
                {getOptionalString, R"({"":"x"})", "", true, "x", ""},
                {getOptionalString, " {\"a\":\t1} z", "A", false, "old",
                 type + R"("JSON":" {\"a\":\t1} z","key":"A"}})"},
                {getOptionalString, "{", "a", false, "old", invalid},
                {getOptionalObjectText,
                 "{\"a\": {\n \"c\" : [ \"\\u0001\\\"\" ] , \"b\" : 1.50 } }", "A", true,
                 "{\"c\":[\"\\u0001\\\"\"],\"b\":1.5}", ""},
                {getOptionalObjectText, R"({"a":{}})", "b", false, "old", ""},
                {getOptionalObjectText, "5", "a", false, "old", ""},
                {getOptionalObjectText, R"({"a":null})", "a", false, "old", noObject},
                {getOptionalObjectText, R"({"a":"{}"})", "a", false, "old", noObject},
                {getOptionalObjectText, "", "a", false, "old", invalid}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.text);
        std::string value = "old";
        bool found = false;
        EXPECT_EQ(row.raised, raisedBy([&] { found = row.lookUp(row.text, row.key, value); }));
        EXPECT_EQ(row.found, found);
        EXPECT_EQ(row.value, value);
    }
}

TEST(MetaData, TellsTheTypeOfTheSelectedReference)
{
    const struct {
        const char *text, *type;
        int32_t code;
        // clang-format off
    } rows[] = {
        {R"({"selectedtrinstid":"A1","trs":{"b":5,"a1":{"x":[],"TYPE":"T b"}}} rest)", "T b", 0},
        {R"({"selectedTRInstID":"a","TRs":{"a":{"type":null}}})", "", 0},
        {R"({"selectedTRInstID":"a","TRs":{"a":{}}})", "", 0},
        {R"({"selectedTRInstID":"a","TRs":{"b":{"type":"T"}}})", "", 0},
        {R"({"selectedTRInstID":"a"})", "", 0}, {R"({"TRs":5})", "", 0}, {"[]", "", 0},
        {R"({"selectedTRInstID":null,"TRs":{"":{"type":"T"}}})", "T", 0},
        {R"({"selectedTRInstID":"","TRs":{"a":{"type":"T"}}})", "", 0},
        {R"({"selectedTRInstID":"a","TRs":5})", "", -52004},
        {R"({"selectedTRInstID":"a","TRs":null})", "", -52004},
        {R"({"selectedTRInstID":"a","TRs":{"a":[]}})", "", -52004},
        {R"({"selectedTRInstID":{},"TRs":{}})", "", -52004},
        {R"({"selectedTRInstID":"a","TRs":{"a":{"type":7}}})", "", -52004}, {"{", "", -52005}};
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.text);
        std::string type;
        const std::string raised = raisedBy([&] { type = getSelectedTimeReferenceType(row.text); });
        EXPECT_EQ(row.type, type);
        EXPECT_EQ(row.code == 0 ? "" : std::to_string(row.code),
                  raised.substr(0, raised.find(' ')));
    }
    const std::string raised = raisedBy([] {
        getSelectedTimeReferenceType(
            "{\"selectedTRInstID\":\"A\",\"TRs\":{\"a\": {\"type\" : 7} }}");
    });
    EXPECT_NE(std::string::npos, raised.find(R"("JSON":"{\"type\":7}","key":"type"}})")) << raised;
}

} // namespace
