// The command line: what it takes, what it refuses and how the program ends.

#include "verbs/commandLine.h"
#include "verbs/verbs.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>

using namespace dravikHost;

namespace {

// What the verb of the tests was given.
struct tGiven {
    bool flag = false;
    int64_t timeNs = 0;
    std::optional<int64_t> wholeNs;
    double share = 0.5;
    std::optional<std::string> kind;
    std::string also = "as before";
    std::vector<std::string> files;
    std::string numbers; // of all that were repeated
    bool ran = false;
};
tGiven given;

void takeNumber(const std::string& text)
{
    if (text == "0") throw std::invalid_argument("0 is refused");
    given.numbers += text;
}

void runVerb()
{
    given.ran = true;
    if (given.also == "fail") throw std::runtime_error("it failed");
    if (given.also == "limit") throw tLimitBroken("a limit");
}

std::function<void()> addVerb(tOptionSet& options)
{
    const tOption flag = options.flag("--flag", given.flag, "");
    options.quantity(given.timeNs, {"--time", kDuration, "2us", "1us", "1ms", "How long"});
    options.quantity(given.wholeNs, {"--whole", kDuration, "", "-1s", "1s", "In all"});
    options.quantity(given.share, {"--share", kRatio, "", "0%", "100%", "A part"});
    options.text("--kind", "KIND", given.kind, "One of the kinds, of which there are two more.")
        .oneOf({"one", "two"})
        .excludes(flag);
    options.text("-a,--also-known-by-the-name", "TEXT", given.also, "").needs(flag).showDefault();
    options.texts("files", "FILE", given.files, "").require();
    options.parsed("-p,--parsed", "NUMBER", takeNumber, "", "7");
    options.repeatable("--number", "NUMBER", takeNumber, "Repeatable");
    options.finally([options] {
        if (options.given("--whole") && given.share == 1) throw std::invalid_argument("not both");
    });
    return runVerb;
}

struct tOutcome {
    int status;
    std::string out, err;
};
tOutcome runWith(std::vector<std::string> words)
{
    given = {};
    words.insert(words.begin(), "dravik-host");
    std::vector<char*> arguments(words.size());
    std::transform(words.begin(), words.end(), arguments.begin(),
                   [](std::string& word) { return word.data(); });
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    const int status = runCommandLine(static_cast<int>(words.size()), arguments.data(),
                                      {{"probe", "A verb", addVerb}});
    const std::string err = testing::internal::GetCapturedStderr();
    return {status, testing::internal::GetCapturedStdout(), err};
}

TEST(CommandLine, givesTheOptionsTheirValues)
{
    EXPECT_EQ(0, runWith({"probe", "a", "b", "--flag", "--time", "1.6us", "--whole", "-1.5ns", "-a",
                          "x y", "--number", "1", "-p", "3", "--number", "2", "--share", "25%"})
                     .status);
    EXPECT_TRUE(given.flag && given.ran);
    EXPECT_EQ(1600, given.timeNs);
    EXPECT_EQ(-2, given.wholeNs); // the nearest
    EXPECT_EQ(0.25, given.share);
    EXPECT_EQ("x y", given.also);
    EXPECT_EQ((std::vector<std::string>{"a", "b"}), given.files);
    EXPECT_EQ("312", given.numbers);
    EXPECT_EQ(0, runWith({"probe", "a"}).status);
    EXPECT_FALSE(given.flag || given.wholeNs || given.kind);
    EXPECT_EQ(2000, given.timeNs); // by default
    EXPECT_EQ(0.5, given.share);   // which has none
    EXPECT_EQ("as before", given.also);
    EXPECT_EQ("", given.numbers);
}

TEST(CommandLine, refusesWhatIsWrong)
{
    const struct {
        int status;
        const char* why; // a line on stderr begins so, behind the name of the program
        std::vector<std::string> words;
    } kRows[] = {
        {0, "", {"probe", "a", "--time", "1us", "--whole", "-1s", "--share", "0"}}, // the bounds
        {0, "", {"probe", "a", "--time", "1ms", "--whole", "1s", "--share", "99%"}},
        {2, "unknown verb proba; did you mean probe?", {"proba"}},
        {2, "unknown verb nothing like it", {"nothing like it"}},
        {2, "unknown option --tim; did you mean --time?", {"probe", "a", "--tim", "1us"}},
        {2, "files is required", {"probe"}},
        {2, "unknown option --none", {"probe", "a", "--none"}},
        {2, "--time: '999ns' is not within 1us to 1ms", {"probe", "a", "--time", "999ns"}},
        {2, "--time: '1.1ms' is not within 1us to 1ms", {"probe", "a", "--time", "1.1ms"}},
        {2, "--time: '5' has no unit; use ns, us, ms, s, min or h", {"probe", "a", "--time", "5"}},
        {2, "--time: 1 required TIME missing", {"probe", "a", "--time"}},
        {2, "--kind: three not in {one,two}", {"probe", "a", "--kind", "three"}},
        {2, "--flag excludes --kind", {"probe", "a", "--kind", "one", "--flag"}},
        {2, "--also-known-by-the-name requires --flag", {"probe", "a", "-a", "x"}},
        {2, "--parsed: 0 is refused", {"probe", "a", "-p", "0"}},
        {2, "not both", {"probe", "a", "--whole", "1s", "--share", "100%"}},
        {1, "it failed", {"probe", "a", "--flag", "-a", "fail"}},
        {3, "a limit", {"probe", "a", "--flag", "-a", "limit"}}};
    for (const auto& row : kRows) {
        const tOutcome found = runWith(row.words);
        const std::string line = row.status == 0 ? "" : std::string("dravik-host: ") + row.why;
        EXPECT_EQ(row.status, found.status) << row.why;
        EXPECT_EQ(line, found.err.substr(0, line.size()));
        EXPECT_EQ(row.status == 0 ? 0 : 1, std::count(found.err.begin(), found.err.end(), '\n'))
            << found.err;
        EXPECT_EQ("", found.out);
        EXPECT_EQ(row.status != 2, given.ran) << row.why;
    }
}

TEST(CommandLine, helps)
{
    const tOutcome bare = runWith({});
    EXPECT_EQ(2, bare.status);
    EXPECT_NE(std::string::npos, bare.err.find("probe   "));
    const tOutcome help = runWith({"probe", "--help"});
    EXPECT_EQ(0, help.status);
    EXPECT_FALSE(given.ran);
    const size_t begin = help.out.find("Positionals");
    EXPECT_EQ(R"(Positionals:
  files FILE ...                  (required)

Options:
  -h,--help                       Print this help message and exit
  --flag                          (not with --kind)
  --time TIME                     How long (default 2us)
  --whole TIME                    In all
  --share PERCENT                 A part
  --kind KIND                     One of the kinds, of which there are two more.
                                  (one of one, two; not with --flag)
  -a,--also-known-by-the-name TEXT
                                  (default as before; needs --flag)
  -p,--parsed NUMBER              (default 7)
  --number NUMBER                 Repeatable

)",
              help.out.substr(begin, help.out.find("Values") - begin));
    EXPECT_NE(std::string::npos, help.out.find("3 a limit of metrics is not held.\n"));
}

} // namespace
