// The tuning parameters, and the document and the file that carry them.

#include "support/allocator.h"
#include "support/raisedBy.h"
#include "support/systemLog.h"
#include "support/tFakeHost.h"
#include "zvckmservo/parameters.h"

#include <algorithm>
#include <clocale>
#include <cmath>
#include <cstdlib>
#include <fstream>
#include <gtest/gtest.h>
#include <limits>
#include <random>
#include <unistd.h>

namespace {

using zvckmDravik::iServoConfig;

std::string refusalAt(int line)
{
    return R"(-52005 {"error_constant":"zvplaterr_invalidParameter","file":"dravik/tServo","line":)" +
           std::to_string(line) + R"(,"component":"dravik"})";
}

// The parameters in the order of the document, with figures of their own. The flag and the size are
// set by calls of other types.
struct tParameter {
    const char* key;
    double (iServoConfig::*get)() const;
    void (iServoConfig::*set)(double);
    double initial, lowest, highest;
    int line; // of a refusal
};
#define DOUBLE(key, Name, initial, lowest, highest, line)                                          \
    {                                                                                              \
        key, &iServoConfig::get##Name, &iServoConfig::set##Name, initial, lowest, highest, line    \
    }
const tParameter kParameters[] = {
    DOUBLE("frequencyLockGain", FrequencyLockGain, 1.0, 1e-9, 10.0, 77),
    DOUBLE("phaseLockGain", PhaseLockGain, 0.55, 1e-9, 10.0, 98),
    DOUBLE("phaseLockCoefficientA", PhaseLockCoefficientA, 2.0, -10.0, 10.0, 119),
    DOUBLE("phaseLockCoefficientB", PhaseLockCoefficientB, 1.0, -10.0, 10.0, 140),
    DOUBLE("phaseLockCoefficientC", PhaseLockCoefficientC, 1.0, -10.0, 10.0, 161),
    DOUBLE("snapTimeThreshold", SnapTimeThreshold, 1e-6, 1e-8, 10.0, 182),
    {"spikeFilterEnabled", nullptr, nullptr, 0, 0, 1, 61}, // in the accessor
    {"spikeFilterHistorySize", nullptr, nullptr, 5, 2, 100, 235},
    DOUBLE("spikeFilterMaxThreshold", SpikeFilterMaxThreshold, 1.0, 1e-9, 10.0, 256),
    DOUBLE("spikeFilterMinThreshold", SpikeFilterMinThreshold, 2.5e-8, 1e-9, 10.0, 277),
    DOUBLE("spikeFilterGrowthFactor", SpikeFilterGrowthFactor, 3.0, 1.001, 100.0, 298)};
#undef DOUBLE

TEST(Parameters, DoublesHaveDefaultsAndInclusiveBounds)
{
    const double infinity = std::numeric_limits<double>::infinity();
    tFakeHost host;
    iServoConfig& config = host.open().config();
    for (const tParameter& row : kParameters) {
        if (row.set == nullptr) continue;
        SCOPED_TRACE(row.key);
        EXPECT_EQ(row.initial, (config.*row.get)());
        for (const double good : {row.lowest, row.highest}) {
            EXPECT_EQ("", raisedBy([&] { (config.*row.set)(good); }));
            EXPECT_EQ(good, (config.*row.get)());
        }
        for (const double bad :
             {std::nextafter(row.lowest, -infinity), std::nextafter(row.highest, infinity),
              -infinity, infinity, std::nan("")}) {
            EXPECT_EQ(refusalAt(row.line), raisedBy([&] { (config.*row.set)(bad); })) << bad;
            EXPECT_EQ(row.highest, (config.*row.get)()) << "a refused value changes nothing";
        }
    }
    EXPECT_EQ("", raisedBy([&] { config.setPhaseLockCoefficientB(0.0); }));
    EXPECT_EQ(refusalAt(77), raisedBy([&] { config.setFrequencyLockGain(0.0); }));
}

// A text file, with one blank for all white space between two words.
std::string wordsOf(const std::string& name)
{
    std::ifstream file(DRAVIK_SOURCE_DIR "/" + name);
    std::string text;
    for (std::string word; file >> word;) {
        text += word + " ";
    }
    return text;
}

TEST(Parameters, AreDescribedAsTheyAre)
{
    const std::string header = wordsOf("include/zvckmservo/servo.h");
    const std::string manual = wordsOf("docs/man/dravik-servo-document.5.scd");
    size_t inHeader = 0; // of the entry before: the order counts
    size_t inManual = 0;
    for (const zvckmservo_Parameter& row : zvckmservo_parameters) {
        const bool flag = row.kind == zvckmservo_kBool;
        const std::string headerEntry = std::string("* \"") + row.key + "\" " +
                                        (flag ? "1, or anything else" : row.boundsText) + " " +
                                        row.initialText + " ";
        const std::string manualEntry =
            std::string("*") + row.key + "* (" + (flag ? "0 or 1" : row.boundsText) +
            (*row.unit != 0 ? " " : "") + row.unit + "; " + row.initialText + ")";
        inHeader = header.find(headerEntry, inHeader);
        EXPECT_NE(std::string::npos, inHeader) << headerEntry;
        inManual = manual.find(manualEntry, inManual);
        EXPECT_NE(std::string::npos, inManual) << manualEntry;
    }
}

TEST(Parameters, HostLimitsAreMultipliedByAPartPerBillion)
{
    tFakeHost host;
    host.maxPpb = 107919; // a division by 1e9 gives another last bit
    host.minPpb = -115838;
    iServoConfig& config = host.open().config();
    EXPECT_EQ(0x1.c4a524d6e8c95p-14, config.getMaxFrequencyOffset());
    EXPECT_EQ(-0x1.e5dc1afc0d5fdp-14, config.getMinFrequencyOffset());
}

// The values of the document in force, in its order.
std::string valuesOf(tFakeHost& host)
{
    char buffer[512] = {};
    EXPECT_EQ(0, zvckmservo_readServoConfigJson(&host.table, buffer, sizeof buffer - 1,
                                                &host.status.record));
    std::string values;
    const std::string text = buffer;
    for (size_t at = text.find(":\t"); at != std::string::npos; at = text.find(":\t", at + 1)) {
        values += text.substr(at + 2, text.find_first_of(",\n", at) - at - 2) + " ";
    }
    return values;
}

TEST(Document, IsGivenOutWholeOrCutToTheBuffer)
{
    const std::string text =
        "{\n\t\"frequencyLockGain\":\t1,\n\t\"phaseLockGain\":\t0.55,\n\t\"phaseLockCoefficientA\":"
        "\t2,\n\t\"phaseLockCoefficientB\":\t1,\n\t\"phaseLockCoefficientC\":\t1,"
        "\n\t\"snapTimeThreshold\":\t1e-06,\n\t\"spikeFilterEnabled\":\t0,"
        "\n\t\"spikeFilterHistorySize\":\t5,\n\t\"spikeFilterMaxThreshold\":\t1,"
        "\n\t\"spikeFilterMinThreshold\":\t2.5e-08,\n\t\"spikeFilterGrowthFactor\":\t3\n}";
    tFakeHost host;
    host.open();
    zverr_Status* const status = &host.status.record;
    for (const size_t size : {text.size() + 5, text.size(), text.size() - 1, size_t{1}}) {
        std::string buffer(size, '#');
        EXPECT_EQ(0, zvckmservo_readServoConfigJson(&host.table, buffer.data(), size, status));
        const size_t copied = std::min(size, text.size());
        EXPECT_EQ(text.substr(0, copied) + std::string(size - copied, '#'), buffer);
    }
    EXPECT_EQ(0, zvckmservo_readServoConfigJson(&host.table, nullptr, 0, status));
    EXPECT_EQ(0, host.code());
}

TEST(Document, IsAppliedInItsOwnOrderUpToTheFirstFailure)
{
    const std::string defaults = "1 0.55 2 1 1 1e-06 0 5 1 2.5e-08 3 ";
    const struct {
        const char* name;
        std::string text;
        const char* refusal; // what the payload says behind the constant; "": none
        std::string values;
    } rows[] = {
        {"nothing", "{}", "", defaults},
        {"no object", "[1]", "", defaults},
        {"all",
         R"({"frequencyLockGain":2,"phaseLockGain":8.2,"phaseLockCoefficientA":4,)"
         R"("phaseLockCoefficientB":5,"phaseLockCoefficientC":6,"snapTimeThreshold":7,)"
         R"("spikeFilterEnabled":1,"spikeFilterHistorySize":8,"spikeFilterMaxThreshold":9,)"
         R"("spikeFilterMinThreshold":1.5,"spikeFilterGrowthFactor":10} behind)",
         "", "2 8.2 4 5 6 7 1 8 9 1.5 10 "},
        {"any case, others ignored", R"({"x":{},"SNAPTIMETHRESHOLD":0.001})", "",
         "1 0.55 2 1 1 0.001 0 5 1 2.5e-08 3 "},
        {"first match", R"({"PhaseLockGain":2,"phaseLockGain":3})", "",
         "1 2 2 1 1 1e-06 0 5 1 2.5e-08 3 "},
        {"first match is bad", R"({"PhaseLockGain":"","phaseLockGain":3})",
         R"("dravik/tJsonConfig","line":86)", defaults},
        {"out of bounds", R"({"phaseLockCoefficientA":9,"phaseLockGain":11,"frequencyLockGain":2})",
         R"("dravik/tServo","line":98)", "2 0.55 2 1 1 1e-06 0 5 1 2.5e-08 3 "},
        {"flag cut", R"({"spikeFilterEnabled":1.9,"spikeFilterHistorySize":7.9})", "",
         "1 0.55 2 1 1 1e-06 1 7 1 2.5e-08 3 "},
        {"flag in words", R"({"spikeFilterEnabled":true})", R"("dravik/tJsonConfig","line":61)",
         defaults},
        {"size cut to 100", R"({"spikeFilterHistorySize":100.99})", "",
         "1 0.55 2 1 1 1e-06 0 100 1 2.5e-08 3 "},
        {"size of 2", R"({"spikeFilterHistorySize":2})", "", "1 0.55 2 1 1 1e-06 0 2 1 2.5e-08 3 "},
        {"size above 100", R"({"spikeFilterHistorySize":101})", R"("dravik/tServo","line":235)",
         defaults},
        {"size below 2", R"({"spikeFilterHistorySize":1.9999})", R"("dravik/tServo","line":235)",
         defaults},
        {"size below 0", R"({"spikeFilterHistorySize":-1})", R"("dravik/tServo","line":235)",
         defaults},
        {"null", R"({"phaseLockGain":null})", R"("dravik/tJsonConfig","line":86)", defaults},
        {"infinite", R"({"phaseLockGain":1e999})", R"("dravik/tServo","line":98)", defaults},
        {"no JSON at the end", R"({"phaseLockGain":2)", R"("dravik/tJsonConfig","line":29)",
         defaults},
        {"nested to the limit", R"({"x":)" + std::string(999, '[') + std::string(999, ']') + "}",
         "", defaults},
        {"nested too deep", R"({"x":)" + std::string(1000, '[') + std::string(1000, ']') + "}",
         R"("dravik/tJsonConfig","line":29)", defaults}};
    for (const char* locale : {"C", "de_DE.UTF-8"}) {
        ASSERT_NE(nullptr, std::setlocale(LC_ALL, locale));
        for (const auto& row : rows) {
            SCOPED_TRACE(testing::Message() << locale << ": " << row.name);
            tFakeHost host;
            host.open();
            const bool refused = *row.refusal != 0;
            EXPECT_EQ(refused ? 1 : 0, zvckmservo_writeServoConfigJson(
                                           &host.table, row.text.c_str(), &host.status.record));
            EXPECT_EQ(refused ? R"({"error_constant":"zvplaterr_invalidParameter","file":)" +
                                    std::string(row.refusal) + R"(,"component":"dravik"})"
                              : "(none)",
                      host.status.text());
            EXPECT_EQ(refused ? -52005 : 0, host.code());
            host.status.reset();
            EXPECT_EQ(row.values, valuesOf(host));
        }
    }
    (void)std::setlocale(LC_ALL, "C");
    tFakeHost host;
    host.open();
    EXPECT_EQ(1, zvckmservo_writeServoConfigJson(&host.table, nullptr, &host.status.record));
    EXPECT_EQ(R"({"error_constant":"zvplaterr_softwareFaultPLATInternalUseOnly",)"
              R"("file":"zverr/tools/exception_errStatus","line":69,"component":"dravik",)"
              R"("std_exception_what":"no configuration text"})",
              host.status.text());
}

TEST(Document, RefusesTheFirstBadMemberInItsOrder)
{
    tFakeHost host;
    iServoConfig& config = host.open().config();
    std::string bad; // from the last one on
    for (size_t i = std::size(kParameters); i-- > 0;) {
        const bool flag = kParameters[i].highest == 1;
        bad.insert(0, std::string("\"") + kParameters[i].key + (flag ? "\":\"\"" : "\":999") +
                          (bad.empty() ? "" : ","));
        const std::string refusal = raisedBy([&] { config.writeServoConfigJson("{" + bad + "}"); });
        const std::string line = R"("line":)" + std::to_string(kParameters[i].line) + ",";
        EXPECT_NE(std::string::npos, refusal.find(line)) << kParameters[i].key;
    }
}

// DRAVIK_ROUND_TRIPS in the environment makes it as long as one likes.
TEST(Document, ReadsBackAsTheVerySameNumbers)
{
    const char* const asked = std::getenv("DRAVIK_ROUND_TRIPS");
    const long rounds = asked != nullptr ? std::strtol(asked, nullptr, 10) : 5000;
    const auto all = [](const iServoConfig& config) {
        std::vector<double> values;
        for (const tParameter& row : kParameters) {
            if (row.get != nullptr) values.push_back((config.*row.get)());
        }
        return values;
    };
    tFakeHost first;
    tFakeHost second;
    iServoConfig& from = first.open().config();
    iServoConfig& to = second.open().config();
    std::mt19937_64 random(1); // NOLINT(cert-msc32-c,cert-msc51-cpp): the same every time
    for (const char* locale : {"C", "de_DE.UTF-8"}) {
        ASSERT_NE(nullptr, std::setlocale(LC_ALL, locale));
        for (long round = 0; round < rounds; ++round) {
            for (const tParameter& row : kParameters) {
                if (row.set == nullptr) continue;
                const double share = static_cast<double>(random()) * 0x1p-64;
                const bool small = random() % 2 == 0 && row.lowest > 0; // all magnitudes alike
                (from.*
                 row.set)(std::clamp(small ? row.lowest * std::pow(row.highest / row.lowest, share)
                                           : row.lowest + (row.highest - row.lowest) * share,
                                     row.lowest, row.highest));
            }
            const std::string text = from.readServoConfigJson();
            to.writeServoConfigJson(text);
            ASSERT_EQ(all(from), all(to)) << text;
        }
    }
    (void)std::setlocale(LC_ALL, "C");
}

// A file of its own that ends with the scope.
struct tScratchFile {
    explicit tScratchFile(const std::string& text)
        : path(testing::TempDir() + "dravik_" + std::to_string(getpid()) + "_%s.json")
    {
        std::ofstream(path) << text;
    }
    ~tScratchFile() { (void)std::remove(path.c_str()); }
    std::string path;
};

TEST(ConfigFile, IsJoinedToOneLineAndApplied)
{
    for (const auto& [text, code, growthFactor] :
         {std::tuple<std::string, int32_t, const char*>{"{\n\"spikeFilterGrowthFactor\"\n:1\n2}\n",
                                                        0, "12 "},
          {"{\r\n\"spikeFilterGrowthFactor\":\r\n7}", 0, "7 "},
          {"{\"spikeFilterGrowthFactor\":1\r\n2}", -52005, "3 "},
          {std::string("{\"spikeFilterGrowthFactor\":4}\0{", 31), 0, "4 "},
          {"{\"spikeFilterGrowthFactor\":1}", -52005, "3 "},
          {"", -52005, "3 "}}) {
        SCOPED_TRACE(text);
        const tScratchFile file(text);
        tFakeHost host;
        tOpenServo& servo = host.open();
        takeSystemLog();
        const std::string refusal = raisedBy([&] { servo.readConfigFile(file.path); });
        EXPECT_EQ(code == 0 ? "" : "-52005", refusal.substr(0, refusal.find(' ')));
        EXPECT_EQ(std::vector<std::string>{"6 [    dravik|                   dravik/tServo|0434] "
                                           "Reading servo configuration from: " +
                                           file.path + "\n"},
                  takeSystemLog());
        const std::string values = valuesOf(host);
        EXPECT_EQ(growthFactor, values.substr(values.rfind(' ', values.size() - 2) + 1));
    }
    tFakeHost host;
    tOpenServo& servo = host.open();
    EXPECT_EQ("", raisedBy([&] { servo.readConfigFile("/none/%n"); }));
    EXPECT_EQ(std::vector<std::string>{"6 [    dravik|                   dravik/tServo|0444] "
                                       "Unable to read configuration from: /none/%n\n"},
              takeSystemLog());
    EXPECT_EQ(raisedBy([&] { servo.writeServoConfigJson(""); }),
              raisedBy([&] { servo.readConfigFile("/"); }))
        << "a folder opens, and has no text";
    EXPECT_EQ(1U, takeSystemLog().size());
}

TEST(ConfigFile, IsNeverAppliedInPartForALackOfMemory)
{
    const tScratchFile file("{\"phaseLockGain\":2}" + std::string(300, ' ') + "\n" +
                            std::string(3000, ' ') + "behind");
    long n = 1;
    for (bool fired = true; fired; ++n) {
        const long before = allocator::liveBlocks();
        {
            tFakeHost host;
            tOpenServo& servo = host.open();
            try {
                const allocator::tFailNth failing(n);
                servo.readConfigFile(file.path);
                fired = failing.fired();
            } catch (const std::bad_alloc&) {
                EXPECT_EQ(0.55, servo.config().getPhaseLockGain()) << "allocation " << n;
            }
            EXPECT_EQ(fired ? 0.55 : 2.0, servo.config().getPhaseLockGain()) << "allocation " << n;
            takeSystemLog();
        }
        EXPECT_EQ(before, allocator::liveBlocks());
    }
    EXPECT_GT(n, 5);
}

// Notes which files it is told to load.
struct tLoadingServo : tOpenServo {
    using tOpenServo::tOpenServo;
    void readConfigFile(const std::string& path) override
    {
        loaded = path.substr(path.rfind('/') + 1);
        if (fails) throw std::runtime_error("unusable");
    }
    std::string loaded;
    bool fails = false;
};

TEST(MetaData, LoadsTheDefaultFileOncePerChangeOfType)
{
    const std::string tab = "IEEE 802.1AS-2011 TAB";
    const std::string bc = "IEEE 1588-2008 BC";
    const struct {
        const char* name;
        std::string type; // "-": metadata that is refused
        const char* loaded;
        bool fails = false;
        // clang-format off
    } rows[] = {
        {"none at first", "", ""}, {"new", bc, "dravik_tr_ptp4l_bc.json"}, {"the same", bc, ""},
        {"another", tab, "dravik_tr_ptp4l_tab.json"}, {"refused", "-", ""},
        {"still the same", tab, ""}, {"unknown is remembered", "ieee 1588-2008 bc", ""},
        {"back again", tab, "dravik_tr_ptp4l_tab.json"}, {"none is remembered", "", ""},
        {"a failing file", tab, "dravik_tr_ptp4l_tab.json", true},
        {"is not tried again", tab, "", true}};
    // clang-format on
    tFakeHost host;
    auto* const servo = new tLoadingServo(&host.table);
    host.table.servoHandle = static_cast<zvckmDravik::tServo*>(servo);
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        const std::string metaData =
            R"({"selectedTRInstID":"a","TRs":{"A":{"type":")" + row.type + R"("}}})";
        servo->loaded = "";
        servo->fails = row.fails;
        host.status.reset();
        zvckmservo_applyMetaData(&host.table, row.type == "-" ? "{" : metaData.c_str(),
                                 &host.status.record);
        EXPECT_EQ(row.loaded, servo->loaded);
        EXPECT_EQ(row.type == "-"                       ? -52005
                  : !servo->loaded.empty() && row.fails ? -52003
                                                        : 0,
                  host.code());
    }
    host.status.reset();
    zvckmservo_applyMetaData(&host.table, nullptr, &host.status.record);
    EXPECT_EQ(0, host.code());
}

} // namespace
