#include "host/stepFixture.h"
#include "text/json.h"
#include "text/words.h"

#include <fcntl.h>
#include <sys/stat.h>

using namespace dravikHost;

namespace {

TEST(Quantity, isReadInItsBaseUnit)
{
    const struct {
        const char* text;
        const tQuantityKind& kind;
        double value;
    } kQuantities[] = {{"125ms", kDuration, 125e6}, {"-12ppm", kFrequency, -12e3},
                       {"1%", kRatio, 0.01},        {"+3us", kDuration, 3e3},
                       {"2min", kDuration, 120e9},  {"1e-3h", kDuration, 3.6e9},
                       {"0", kFrequency, 0},        {"7ppb", kFrequency, 7},
                       {"1.5s", kDuration, 1.5e9},  {"-0.25ns", kDuration, -.25}};
    const struct {
        const char* text;
        const tQuantityKind& kind;
        const char* why;
    } kRefused[] = {{"5ppm", kDuration, " has an unknown unit 'ppm'; use ns, us, ms, s, min or h"},
                    {"5x", kFrequency, " has an unknown unit 'x'; use ppb or ppm"},
                    {"5", kRatio, " has no unit; use %"},
                    {"1e999s", kDuration, " is out of range"},
                    {"+-1s", kDuration, " does not start with a number"},
                    {"nan", kDuration, " does not start with a number"},
                    {"inf%", kRatio, " does not start with a number"},
                    {"", kDuration, " does not start with a number"},
                    {"1,5s", kDuration, " has an unknown unit ',5s'; use ns, us, ms, s, min or h"},
                    {"1 s", kDuration, " has an unknown unit ' s'; use ns, us, ms, s, min or h"}};
    for (const auto& row : kQuantities)
        EXPECT_DOUBLE_EQ(row.value, parseQuantity(row.text, row.kind)) << row.text;
    for (const auto& row : kRefused) {
        const std::string why = failureOf([&] { parseQuantity(row.text, row.kind); });
        EXPECT_EQ(std::string("'") + row.text + "'" + row.why, why);
    }
}

TEST(Quantity, isWrittenForPeople)
{
    for (const auto& [ns, text, withSign] :
         {std::tuple<double, const char*, const char*>{0, "0 ns", "+0 ns"},
          {-0.5, "-0.5 ns", "-0.5 ns"},
          {999.4, "999.4 ns", "+999.4 ns"},
          {1e3, "1 us", "+1 us"},
          {-1500, "-1.5 us", "-1.5 us"},
          {1012345, "1.012 ms", "+1.012 ms"},
          {1e9, "1 s", "+1 s"},
          {7200e9, "7200 s", "+7200 s"},
          {999999, "1000 us", "+1000 us"},
          {-1e9, "-1 s", "-1 s"},
          {9999.5e9, "10000 s", "+10000 s"},
          {9.9e23, "990000000000000 s", "+990000000000000 s"},
          {1e24, "1e+15 s", "+1e+15 s"},
          {9e-4, "0.9 ps", "+0.9 ps"},
          {1e-3, "0.001 ns", "+0.001 ns"},
          {-1e-7, "-0.0001 ps", "-0.0001 ps"},
          {9e-8, "0 ns", "+0 ns"}}) {
        EXPECT_EQ(text, durationText(ns));
        EXPECT_EQ(withSign, signedDurationText(ns));
    }
    EXPECT_EQ("0 ns", durationText(-0.0));
    EXPECT_EQ("+0 ns", signedDurationText(-9.191e-17));
    EXPECT_EQ("out of range", signedDurationText(-INFINITY));
    EXPECT_EQ("out of range", durationText(NAN));
    EXPECT_EQ("-1.5 us", durationText(int64_t{-1500}));
    EXPECT_EQ("+2 ms", signedDurationText(int64_t{2'000'000}));
    EXPECT_EQ("+11.980 ppm", offsetText(11980));
    EXPECT_EQ("-0.001 ppm", offsetText(-1));
    EXPECT_EQ("+0.000 ppm", offsetText(-0.4));
    EXPECT_EQ("-0.001 ppm", offsetText(-0.5));
    EXPECT_EQ("out of range", offsetText(INFINITY));
    EXPECT_EQ("2.125", secondsText(2'125'999'999, 3));
    EXPECT_EQ("0.000000007", secondsText(7, 9));
    EXPECT_EQ("1000000000.0", secondsText(1'000'000'000'000'000'000, 1));
    EXPECT_DOUBLE_EQ(-2.5, secondsOf(-2'500'000'000));
    EXPECT_DOUBLE_EQ(-2.5e9, nsOf(-2.5));
}

TEST(Words, areSplitOff)
{
    std::string_view lines = "a b\r\n\nc";
    for (const char* const line : {"a b", "", "c", ""})
        EXPECT_EQ(line, takeLine(lines));
    std::string_view words = " \tone  two\tthree ";
    for (const char* const word : {"one", "two", "three", "", ""})
        EXPECT_EQ(word, takeWord(words));
    std::string_view fields = "x,, y,";
    for (const char* const field : {"x", "", " y", "", ""})
        EXPECT_EQ(field, takeField(fields));
    EXPECT_EQ("/dev/ptp0", afterPrefix("phc:/dev/ptp0", "phc:"));
    for (const char* const other : {"phc:", "shm:2", "a phc:x", ""})
        EXPECT_FALSE(afterPrefix(other, "phc:")) << other;
}

TEST(Words, areGuessedFromAThirdOfTheirLetters)
{
    EXPECT_EQ("; did you mean one?", didYouMean("OnE", {"two", "one", "ode"}));
    for (const char* const word : {"bcdefghijX", "YabcdefghX", "aXcdXfghXi", "abcdef"})
        EXPECT_EQ("; did you mean abcdefghi?", didYouMean(word, {"b", "abcdefghi"})) << word;
    for (const char* const word : {"bcdefghijXY", "aXcdXfghXX", "abcde", ""})
        EXPECT_EQ("", didYouMean(word, {"abcdefghi"})) << word;
    EXPECT_EQ("", didYouMean("a", {}));
}

TEST(Words, areNumbersAsAWhole)
{
    EXPECT_EQ(5, numberIn<int32_t>("+5"));
    EXPECT_EQ(-2147483648, numberIn<int32_t>("-2147483648"));
    EXPECT_EQ(-1.5e3, numberIn<double>("-1.5e3"));
    for (const char* const text : {"", "+", "+-5", "5 ", " 5", "5x", "2147483648"})
        EXPECT_FALSE(numberIn<int32_t>(text)) << text;

    EXPECT_EQ(12'000'000'000, secondsIn("12"));
    EXPECT_EQ(1'050'000'000, secondsIn("1.05"));
    EXPECT_EQ(7, secondsIn("0.000000007"));
    EXPECT_EQ(2'000'000'000'999'999'999, secondsIn("2000000000.999999999"));
    for (const char* const text :
         {"", ".5", "1.", "-1", "1.-5", "2000000001", "1.0000000001", "1.5s"})
        EXPECT_FALSE(secondsIn(text)) << text;
}

TEST(Json, isWrittenMemberByMember)
{
    tJsonObject object;
    object.add("a\"b", 0.1).add("none", std::nullopt).add("some", std::optional<double>(-2e-9));
    object.add("text", jsonQuoted("one\ntwo"));
    EXPECT_EQ(R"({"a\"b": 0.1, "none": null, "some": -2e-09, "text": "one\ntwo"})", object.line());
    EXPECT_EQ("{\n  \"a\": 1,\n  \"b\": 2\n}\n", tJsonObject().add("a", 1).add("b", 2).lines());
    EXPECT_EQ(R"({"a":[1,null]})", jsonText(parseJson(" { \"a\" : [1, null]}").get()));
    EXPECT_EQ(nullptr, parseJson("{"));
}

TEST(Files, areWrittenAndReplacedAsAWhole)
{
    const std::string longText(10'000, 'x');
    const tTestFile file("text", longText);
    EXPECT_EQ(longText, readText(file.path));
    const tFile reader(std::fopen(file.path.c_str(), "re"));
    replaceText(file.path, "new");
    EXPECT_EQ("new", readText(file.path));
    EXPECT_EQ(longText, readToEnd(reader.get(), "reader")); // who reads meanwhile has the old one
    EXPECT_NE(0, access((file.path + ".new").c_str(), F_OK));
}

TEST(Files, nameWhatFailsAndWhy)
{
    EXPECT_EQ("cannot read /no/file: No such file or directory",
              failureOf([] { readText("/no/file"); }));
    EXPECT_EQ("cannot read /: Is a directory", failureOf([] { readText("/"); }));
    EXPECT_EQ("cannot write /no/file: No such file or directory",
              failureOf([] { writeText("/no/file", ""); }));
    const tTestFile folder("folder");
    ASSERT_EQ(0, mkdir(folder.path.c_str(), 0700));
    EXPECT_EQ("cannot write " + folder.path + ": Is a directory",
              failureOf([&] { replaceText(folder.path, ""); }));
    rmdir(folder.path.c_str());
    for (const size_t size : {size_t{1}, size_t{1'000'000}}) { // when flushed, and when written
        EXPECT_EQ("cannot write /dev/full: No space left on device",
                  failureOf([&] { writeText("/dev/full", std::string(size, 'x')); }));
    }
}

TEST(Files, areClosedWithTheirScope)
{
    const int fd = open("/", O_RDONLY | O_CLOEXEC);
    {
        const tDescriptor owner(fd);
        EXPECT_EQ(fd, owner.get());
    }
    EXPECT_EQ(-1, fcntl(fd, F_GETFD));
}

} // namespace
