// The platform layer: mutex, fixed record, memory, containers, dynamic loading.

#include "support/allocator.h"
#include "support/systemLog.h"
#include "support/tHostStatus.h"
#include "zvdynlib/dynload.h"
#include "zverr/Exception.h"
#include "zverr/errStatus.h"
#include "zverr/jsonzLookup.h"
#include "zverr/tools/exception_errStatus.h"
#include "zvhostq/stdpath.h"
#include "zvhostq/stdpath_table.h"
#include "zvhostq/stdpath_util.h"
#include "zvktl/err/string.h"
#include "zvktl/err/vector.h"
#include "zvplat/protons/cppNewDelete/memoryAllocation.h"
#include "zvplat/quarks/synchronization.h"
#include "zvplat/tFixedStatusAdapter.h"
#include "zvplat/tFixedStatusGuard.h"
#include "zvsdbg/debugLine.h"

#include <atomic>
#include <cstring>
#include <dlfcn.h>
#include <fstream>
#include <functional>
#include <gtest/gtest.h>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <unistd.h>

namespace {

using zvplat::tFixedStatus;

const char* const kMemoryFull =
    R"({"error_constant":"zvplaterr_memoryFull","file":"zvktl/err/Allocator","line":32,)"
    R"("component":"dravik"})";

TEST(Mutex, CanBeTakenTwiceOnOneThreadAndExcludesAnother)
{
    tFixedStatus status;
    tMutex mutex(&status);
    ASSERT_EQ(0, status.code);
    std::atomic<bool> entered{false};
    std::thread other;
    {
        const tMutexGuard outer(mutex);
        {
            const tMutexGuard inner(mutex);
        }
        other = std::thread([&] {
            const tMutexGuard guard(mutex);
            entered = true;
        });
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        EXPECT_FALSE(entered) << "one release of two does not free it";
    }
    other.join();
    EXPECT_TRUE(entered);
}

TEST(FixedStatus, KeepsBothEndsOfALongFileAndTheStartOfALongComponent)
{
    const std::string start(49, 'a');
    const std::string end(49, 'z');
    tFixedStatus reused;
    const auto around = [&](const std::string& middle) {
        return std::string(start).append(middle).append(end);
    };
    for (const auto& [component, file, keptComponent, keptFile] :
         {std::tuple<std::string, std::string, std::string, std::string>{"dravik", "unit", "dravik",
                                                                         "unit"},
          {"123456789", around("12"), "123456789", around("12")},
          {"123456789A", around("123"), "123456789", around("..")},
          {"", around(std::string(300, '-')), "", around("..")}}) {
        reused.code = 2; // a failure replaces a warning and all of its text
        EXPECT_TRUE(reused.set(-5, component.c_str(), file.c_str(), 7));
        EXPECT_EQ(-5, reused.code);
        EXPECT_EQ(keptComponent, reused.component);
        EXPECT_EQ(keptFile, reused.file);
        EXPECT_EQ(7U, reused.line);
        EXPECT_FALSE(reused.set(-6, "other", "other", 8));
        EXPECT_EQ(keptFile, reused.file);
        EXPECT_EQ(-5, reused.code);
        for (size_t i = keptFile.size(); i < sizeof reused.file; ++i) {
            EXPECT_EQ(0, reused.file[i]);
        }
    }
    tFixedStatus codeOnly;
    codeOnly.size = tFixedStatus::kStamp - 1;
    EXPECT_TRUE(codeOnly.set(-5, "c", "f", 7));
    EXPECT_EQ(-5, codeOnly.code);
    EXPECT_STREQ("", codeOnly.file);
    EXPECT_EQ(0U, codeOnly.line);
}

TEST(FixedStatus, GoesIntoAStatusAsFarAsThereIsRoom)
{
    const std::string escapes(100, '\x01'); // more than there is room for
    const struct {
        const char* name;
        int32_t code;
        const char* component;
        std::string file;
        int32_t before;
        const char* textBefore;
        int32_t after;
        const char* text;
        bool refuses = false;
    } rows[] = {{"all", -5, "c", "f", 0, nullptr, -5, R"({"file":"f","line":7,"component":"c"})"},
                {"a warning", 5, "c", "", 0, nullptr, 5, R"({"component":"c"})"},
                {"bare", -5, "", "", 0, nullptr, -5, "(none)"},
                {"nothing", 0, "c", "f", 0, nullptr, 0, "(none)"},
                {"over a warning", -5, "", "f", 2, R"({"w":1})", -5, R"({"file":"f","line":7})"},
                {"under a failure", -5, "c", "f", -1, R"({"w":1})", -1, R"({"w":1})"},
                {"no memory", -5, "c", "f", 0, nullptr, -5, "(none)", true},
                {"too long a file", -5, "c", escapes, 0, nullptr, -5, R"({"component":"c"})"}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        tFixedStatus fixed;
        fixed.set(row.code, row.component, row.file.c_str(), 7);
        tHostStatus host(row.before, row.textBefore);
        host.mode = row.refuses ? tHostStatus::kRefuse : tHostStatus::kGive;
        zverr_takeFixedStatus(fixed, &host.record);
        EXPECT_EQ(row.after, host.code());
        EXPECT_EQ(row.text, host.text());
        fixed.size = tFixedStatus::kStamp - 1;
        tHostStatus bare;
        zverr_takeFixedStatus(fixed, &bare.record);
        EXPECT_EQ(row.code, bare.code());
        EXPECT_EQ("(none)", bare.text());
    }
}

TEST(FixedStatus, GuardRaisesFailuresOnlyAndOnlyOutsideAnUnwinding)
{
    try {
        zvplat::tFixedStatusGuard guard;
        guard.set(-5, "c", "f", 7);
    } catch (const zverr::Exception& failure) {
        EXPECT_EQ(-5, failure.status.code);
        EXPECT_STREQ(R"({"file":"f","line":7,"component":"c"})", failure.what());
        EXPECT_EQ(512U, failure.status.capacity);
    }
    EXPECT_NO_THROW({
        zvplat::tFixedStatusGuard guard;
        guard.set(5, "c", "f", 7);
    });
    try {
        zvplat::tFixedStatusGuard guard;
        guard.set(-5, "c", "f", 7);
        throw 42;
    } catch (int thrown) {
        EXPECT_EQ(42, thrown);
    }
}

TEST(FixedStatus, AdapterShowsTheEndsOfWhatAStatusHolds)
{
    const struct {
        const char* name;
        int32_t code;
        std::string text;
        std::string component, file;
        uint32_t line;
    } rows[] = {{"all", -5, R"({"component":"abc","file":"f","line":7})", "abc", "f", 7},
                {"a warning", 5, R"({"line":-1})", "", "", UINT32_MAX},
                {"long names", -5,
                 R"({"component":"0123456789","file":"xy)" + std::string(99, 'f') + R"("})",
                 "123456789", "y" + std::string(99, 'f'), 0},
                {"cut in an escape", -5, R"({"component":"\u0041b\n34567"})", "1b\n34567", "", 0},
                {"cut to a bad one", -5, R"({"component":"12\\u56x8901","file":"f"})", "", "f", 0},
                {"bad behind good", -5, R"({"component":"ab\u0000c"})", "ab", "", 0},
                {"other types", -5, R"({"component":1,"file":null,"line":"7"})", "", "", 0},
                {"no JSON", -5, R"({"line":7,"component":)", "", "", 7},
                {"no object", -5, R"(["component","c"])", "", "", 0},
                {"no failure", 0, R"({"component":"abc","file":"f","line":7})", "", "", 0}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        tHostStatus host(row.code, row.text.c_str());
        {
            zvplat::tFixedStatusAdapter adapter(&host.record);
            EXPECT_EQ(row.code, adapter.get()->code);
            EXPECT_EQ(row.component, adapter.get()->component);
            EXPECT_EQ(row.file, adapter.get()->file);
            EXPECT_EQ(row.line, adapter.get()->line);
        }
        EXPECT_EQ(row.code, host.code()) << "the way there and back changes nothing";
        EXPECT_EQ(row.text, host.text());
    }
}

TEST(Memory, ArraysAreNullAfterAFailureAndWithoutMemory)
{
    const auto arrayFor = [](zverr_Status* status) {
        return std::unique_ptr<char[]>(
            zvplat::newArray(255, zvplat::tFixedStatusAdapter(status).get()));
    };
    tHostStatus clean;
    EXPECT_NE(nullptr, arrayFor(&clean.record));
    EXPECT_EQ(0, clean.code());
    EXPECT_EQ("(none)", clean.text());
    tHostStatus failed(-1, R"({"b":2})");
    EXPECT_EQ(nullptr, arrayFor(&failed.record));
    EXPECT_EQ(R"({"b":2})", failed.text());
    tHostStatus warned(2, R"({"component":"old"})");
    tHostStatus throwing;
    throwing.mode = tHostStatus::kThrow;
    for (tHostStatus* const status : {&throwing, &warned}) {
        const allocator::tFailNth failing(1);
        EXPECT_EQ(nullptr, arrayFor(&status->record));
    }
    EXPECT_EQ(-52000, throwing.code());
    EXPECT_EQ(-52000, warned.code());
    EXPECT_EQ(R"({"file":"zvplat/protons/cppNewDelete/memoryAllocation","line":346,)"
              R"("component":"dravik"})",
              warned.text());
}

using zvktl::err::string;
using tBytes = zvktl::err::vector<char>;

// An element as the containers want it: two strings.
struct tPair {
    tPair() = default;
    tPair(const tPair& other, zverr_Status* status)
        : name(other.name, status), value(other.value, status)
    {}
    void swap(tPair& other)
    {
        name.swap(other.name);
        value.swap(other.value);
    }
    string name;
    string value;
};
using tPairs = zvktl::err::vector<tPair>;

std::string textOf(const tBytes& bytes) { return {bytes.data, bytes.size}; }

std::string textOf(const tPairs& pairs)
{
    std::string text;
    for (size_t i = 0; i < pairs.size; ++i) {
        text += std::string(pairs.data[i].name.getText()) + pairs.data[i].value.getText() + " ";
    }
    return text;
}

// Inserts a pair as the owner of a vector does it.
void insert(tPairs& pairs, size_t position, const std::string& name, zverr_Status* status)
{
    tPair pair;
    pair.name.assign(name.data(), name.size(), status);
    pairs.open_gap(position, 1, status);
    if (status->code < 0) return;
    pairs.data[position].swap(pair);
    ++pairs.size;
}

TEST(String, CapacitiesAndContents)
{
    tHostStatus status;
    zverr_Status* const s = &status.record;
    string text;
    EXPECT_STREQ("", text.getText());
    text.assign("", 0, s);
    EXPECT_EQ(0U, text.getCapacity()) << "nothing to store, nothing allocated";
    text.reserve(0, s);
    EXPECT_EQ(127U, text.getCapacity());
    text.assign("ab", 2, s);
    text.reserve(128, s);
    EXPECT_EQ(190U, text.getCapacity());
    EXPECT_STREQ("ab", text.getText());
    text.reserve(1000, s);
    const char* const before = text.getText();
    text.reserve(999, s);
    text.assign(std::string(1000, 'x').c_str(), 1000, s);
    EXPECT_EQ(before, text.getText()) << "what fits stays in place";
    text.assign(before + 998, 2, s);
    EXPECT_STREQ("xx", text.getText());
    text.assign(std::string(1001, 'y').c_str(), 1001, s);
    EXPECT_EQ(1001U, text.getCapacity()) << "no growth by half";
    text.assign("", 0, s);
    EXPECT_EQ(0U, text.getSize());
    EXPECT_STREQ("", text.getText());

    const string longer(std::string(200, 'z').c_str(), s);
    const string copy(longer, s);
    EXPECT_STREQ(longer.getText(), copy.getText());
    EXPECT_NE(longer.getText(), copy.getText());
    EXPECT_EQ(0, status.code());
    text.reserve(SIZE_MAX, s);
    EXPECT_EQ(-52000, status.code());
    EXPECT_EQ(kMemoryFull, status.text());
}

TEST(Vectors, OpenGapsAndGrowByHalf)
{
    tHostStatus status;
    zverr_Status* const s = &status.record;
    tBytes bytes;
    tPairs pairs;
    std::string expectedBytes;
    std::string expectedPairs;
    for (size_t i = 0; i < 19; ++i) {
        const size_t position = i * 7 % (i + 1); // front, end and between
        const std::string name(1, static_cast<char>('a' + i));
        bytes.insert(position, 2, name[0], s);
        insert(pairs, position, name, s);
        expectedBytes.insert(position, 2, name[0]);
        expectedPairs.insert(2 * position, name + " ");
        EXPECT_EQ(expectedBytes, textOf(bytes));
        EXPECT_EQ(expectedPairs, textOf(pairs));
    }
    EXPECT_EQ(27U, pairs.capacity);
    EXPECT_EQ(40U, bytes.capacity); // of 38 bytes
    pairs.open_gap(1, 5, s);
    EXPECT_STREQ("", pairs.data[1].name.getText());
    EXPECT_STREQ("", pairs.data[5].value.getText());
    pairs.size += 5;
    EXPECT_EQ(expectedPairs.size() + 5, textOf(pairs).size());
    pairs.clear();
    EXPECT_EQ(0U, pairs.size);
    EXPECT_EQ(27U, pairs.capacity);
    EXPECT_EQ(0, status.code());

    bytes.insert(0, SIZE_MAX, 'x', s);
    EXPECT_EQ(kMemoryFull, status.text());
    for (const size_t count : {SIZE_MAX, size_t{178956971}}) {
        status.reset();
        insert(pairs, 0, "a", s);
        status.mode = tHostStatus::kRefuse; // no payload: what is allocated is the array
        const long before = allocator::allocations();
        pairs.open_gap(0, count, s);
        EXPECT_EQ(-52000, status.code());
        EXPECT_EQ(before, allocator::allocations()) << "not even tried";
        status.mode = tHostStatus::kGive;
    }
}

TEST(Containers, DoNothingUnderAFailureAndKeepTheirContentsWithoutMemory)
{
    // Each changes something large enough to need memory; the object holds what it held if it
    // fails.
    struct tObjects {
        explicit tObjects(zverr_Status* status) : text("text", status)
        {
            bytes.insert(0, 8, 'b', status);
            for (int i = 0; i < 8; ++i) {
                insert(pairs, 0, "p", status);
            }
        }
        std::string all() const { return text.getText() + textOf(bytes) + textOf(pairs); }
        string text;
        tBytes bytes;
        tPairs pairs;
    };
    const std::string longText(300, 'x');
    const struct {
        const char* name;
        std::function<void(tObjects&, zverr_Status*)> change;
        long allocations;
    } rows[] = {{"construct", [&](tObjects&, zverr_Status* s) { string(longText.c_str(), s); }, 1},
                {"copy", [](tObjects& o, zverr_Status* s) { string(o.text, s); }, 1},
                {"reserve", [](tObjects& o, zverr_Status* s) { o.text.reserve(300, s); }, 1},
                {"assign",
                 [&](tObjects& o, zverr_Status* s) { o.text.assign(longText.c_str(), 300, s); }, 1},
                {"assign less", [](tObjects& o, zverr_Status* s) { o.text.assign("x", 1, s); }, 0},
                {"insert", [](tObjects& o, zverr_Status* s) { o.bytes.insert(4, 1, 'x', s); }, 1},
                {"open_gap", [](tObjects& o, zverr_Status* s) { insert(o.pairs, 4, "x", s); }, 18},
                {"chain",
                 [&](tObjects&, zverr_Status* s) {
                     const string name(longText.c_str(), s);
                     const string copy(name, s);
                 },
                 2}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        tHostStatus good;
        tHostStatus failed(-1, R"({"b":2})");
        const long before = allocator::liveBlocks();
        {
            tObjects untouched(&good.record);
            const std::string contents = untouched.all();
            const long allocations = allocator::allocations();
            row.change(untouched, &failed.record);
            EXPECT_EQ(allocations, allocator::allocations());
            EXPECT_EQ(contents, untouched.all());
        }
        EXPECT_EQ(before, allocator::liveBlocks());
        EXPECT_EQ(R"({"b":2})", failed.text());
        long n = 1;
        for (bool fired = true; fired; ++n) {
            tHostStatus status;
            tObjects objects(&good.record);
            const std::string contents = objects.all();
            {
                const allocator::tFailNth failing(n);
                row.change(objects, &status.record);
                fired = failing.fired();
            }
            EXPECT_EQ(fired ? -52000 : 0, status.code()) << "allocation " << n;
            EXPECT_EQ(fired ? kMemoryFull : "(none)", status.text());
            EXPECT_EQ(fired ? contents : objects.all(), objects.all());
        }
        EXPECT_EQ(row.allocations, n - 2);
        EXPECT_EQ(before, allocator::liveBlocks());
    }
}

TEST(Details, AreAllThatExhaustedMemoryCosts)
{
    const std::string longText(2000, '\n'); // more than two buffers
    const std::runtime_error thrown(longText);
    for (const auto& [name, fail, code, allocations] :
         {std::tuple<const char*, std::function<void(zverr_Status*)>, int32_t, long>{
              "load", [&](zverr_Status* s) { zvdynlib_load(longText.c_str(), RTLD_NOW, s); },
              -52005, 6},
          {"symbol", [](zverr_Status* s) { zvdynlib_symbol(nullptr, "?", s); }, -52005, 1},
          {"fixed record",
           [](zverr_Status* s) { zvplat::tFixedStatusAdapter(s).get()->set(-5, "c", "f", 7); }, -5,
           1},
          {"exception",
           [&thrown](zverr_Status* s) {
               try {
                   throw std::runtime_error(thrown); // the copy shares its text
               } catch (...) {
                   zverr_exceptionToStatus(s);
               }
           },
           -52003, 5}}) {
        SCOPED_TRACE(name);
        const long before = allocator::liveBlocks();
        long n = 1;
        size_t length = 0;
        for (bool fired = true; fired; ++n) {
            zverr_Status status = zverr_emptyStatus();
            {
                const allocator::tFailNth failing(n);
                fail(&status);
                fired = failing.fired();
            }
            EXPECT_EQ(code, status.code);
            expectBufferForm(status);
            if (status.json != nullptr) {
                EXPECT_NE(nullptr, jsonz_closingBracket(status.json));
                EXPECT_LE(length, std::strlen(status.json)) << "more memory, more details";
                length = std::strlen(status.json);
            }
            zverr_releaseJson(&status);
        }
        EXPECT_EQ(allocations, n - 2);
        EXPECT_EQ(before, allocator::liveBlocks());
    }
}

TEST(ReadWholeFile, GivesItsBytesAndAZeroOrSaysWhatTheSystemSaid)
{
    const std::string path = testing::TempDir() + "dravik_" + std::to_string(getpid());
    std::ofstream(path) << "abc";
    int pipeEnds[2];
    ASSERT_EQ(0, pipe(pipeEnds));
    const std::string pipePath = "/proc/self/fd/" + std::to_string(pipeEnds[0]);
    const std::string notRead =
        R"({"error_constant":"zvplaterr_osFault","file":"zvhostq/stdpath_util","line":249,)"
        R"("component":"dravik","internal_error":{"api":"errno","code":)";
    const std::string folder =
        notRead +
        R"(21,"string":"Is a directory"},"zvhostq_debug":{)"
        R"("desc":"didn't read full content of file","fileSize":0,"fread_return":0,"filename":)";
    const struct {
        const char* name;
        std::string path;
        int32_t before;
        std::string content; // "old content" before
        int32_t code;
        std::string text;
    } rows[] = {
        {"shorter than before", path, 0, std::string("abc\0", 4), 0, "(none)"},
        {"under a failure", path, -1, "old content", -1, "(none)"},
        {"missing", "/none", 0, "old content", -52006,
         R"({"error_constant":"zvplaterr_resourceNotFound","file":"zvhostq/stdpath_util","line":224,)"
         R"("component":"dravik","internal_error":{"api":"errno","code":2,)"
         R"("string":"No such file or directory"},)"
         R"("zvhostq_debug":{"desc":"error opening file","filename":"/none"}})"},
        {"missing under a failure", "/none", -1, "old content", -1, "(none)"},
        {"a folder", "/", 0, "old content", -52008, folder + R"("/"}})"},
        {"a folder that looks empty", "/proc/self", 0, "old content", -52008,
         folder + R"("/proc/self"}})"},
        {"a pipe", pipePath, 0, "old content", -52008,
         notRead +
             R"(29,"string":"Illegal seek"},"zvhostq_debug":{)"
             R"("desc":"didn't read full content of file","fileSize":4294967295,"fread_return":0,)"
             R"("filename":")" +
             pipePath + R"("}})"}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        tHostStatus status(row.before);
        tBytes content;
        tHostStatus good;
        content.insert(0, 11, 0, &good.record);
        std::string("old content").copy(content.data, 11);
        zvhostq::read_whole_file(row.path.c_str(), &content, &status.record);
        EXPECT_EQ(row.code, status.code());
        EXPECT_EQ(row.text, status.text());
        EXPECT_EQ(row.content, textOf(content));
    }
    close(pipeEnds[0]);
    close(pipeEnds[1]);
    tHostStatus status;
    tBytes content;
    {
        const allocator::tFailNth failing(1);
        zvhostq::read_whole_file(path.c_str(), &content, &status.record);
    }
    EXPECT_EQ(-52000, status.code());
    EXPECT_EQ(0U, content.size);
    (void)std::remove(path.c_str());
    std::string shared = "old";
    zvhostq::read_shared_dir(shared, &status.record);
    EXPECT_EQ("old", shared) << "under a failure";
}

TEST(StandardDirectories, AreNotThereUnderAnotherName)
{
    tHostStatus status;
    string value;
    zvhostq::stdpath_table::instance(&status.record)
        .get(string("bin", &status.record), &value, &status.record);
    EXPECT_EQ(-52008, status.code());
}

TEST(DebugLine, KeepsItsFormHoweverLongItsParts)
{
    const std::string head = "6 [    dravik|";
    const std::string prefix = head + "                   dravik/tServo|0434] ";
    const std::string longest(459, 'm');
    const tDebugLocation servo = {"dravik/tServo", 434, "\n"};
    const tDebugLocation onAndOn = {"dravik/tServo", 434, " and so on\n"};
    const std::string file32(32, 'f');
    const std::string file33 = "x" + file32;
    const struct {
        const char* name;
        int32_t level;
        tDebugLocation location;
        std::string message;
        std::string line; // "": dropped
    } rows[] = {
        {"dropped", 4095, servo, "m", ""},
        {"lowest level", 4096, servo, "m", prefix + "m\n"},
        {"empty message", 8192, servo, "", prefix + "\n"},
        {"longest message", 8192, servo, longest, prefix + longest + "\n"},
        {"cut", 8192, servo, std::string(2000, 'm'), prefix + longest + "\n"},
        {"long end", 8192, onAndOn, longest, prefix + std::string(449, 'm') + " and so on\n"},
        {"no end", 8192, {"dravik/tServo", 434, ""}, "m", prefix + "m"},
        {"file of 32", 8192, {file32.c_str(), 12345, ""}, "m", head + file32 + "|2345] m"},
        {"file of 33", 8192, {file33.c_str(), 0, ""}, "m", head + file32 + "|0000] m"}};
    takeSystemLog();
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        const tDebugLocation location = row.location;
        zvsdbg_line(row.level, &location, "%s", row.message.c_str());
        const std::vector<std::string> log = takeSystemLog();
        EXPECT_EQ(row.line.empty() ? std::vector<std::string>{} : std::vector{row.line}, log);
    }
}

TEST(DebugLine, FieldsStayInTheirBuffer)
{
    struct Row {
        size_t remaining;
        const char* text;
        int32_t width;
        const char* out; // behind one byte that is always there
    };
    for (const Row& row :
         {Row{8, "abc", 0, "_abc"}, Row{8, "abc", 5, "_..abc"}, Row{8, "abc", 2, "_bc"},
          Row{3, "abc", 0, "_ab"}, Row{4, "ab", 5, "_..."}, Row{3, "ab", 5, "_.."},
          Row{2, "ab", 9, "_."}, Row{1, "ab", 2, "_"}, Row{0, "ab", 2, ""}, Row{0, "a", 5, ""}}) {
        SCOPED_TRACE(testing::Message() << row.remaining << " " << row.text << " " << row.width);
        std::vector<char> buffer(row.remaining + 1, '#'); // nothing behind it
        buffer[0] = '_';
        char* const end = write_field(buffer.data() + 1, row.remaining, row.text, row.width, '.');
        EXPECT_STREQ(row.out, buffer.data());
        EXPECT_EQ(buffer.data() + std::strlen(row.out), end);
    }
}

TEST(Dynload, ReportsWhatTheLoaderSays)
{
    tHostStatus status;
    EXPECT_EQ(nullptr, zvdynlib_load("/none/lib.so", RTLD_NOW, &status.record));
    EXPECT_EQ(-52005, status.code());
    const std::string text = status.text();
    EXPECT_EQ(R"({"error_constant":"zvplaterr_invalidParameter","file":"zvdynlib/dynload",)"
              R"("line":110,"component":"dravik","zvdynlib_debug":{)"
              R"("debug":"failed to zvdynlib_load library","path":"/none/lib.so"},)"
              R"("internal_error":{"api":"dlerror","string":")"
              R"(/none/lib.so: cannot open shared object file: No such file or directory"}})",
              text);
    EXPECT_EQ(nullptr, zvdynlib_symbol(RTLD_DEFAULT, "malloc", &status.record));
    EXPECT_EQ(nullptr, zvdynlib_load("libc.so.6", RTLD_NOW, &status.record));
    EXPECT_EQ(text, status.text()) << "a chain keeps its first failure";

    tHostStatus warned(2);
    void* const handle = zvdynlib_load("libc.so.6", RTLD_NOW, &warned.record);
    ASSERT_NE(nullptr, handle);
    EXPECT_NE(nullptr, zvdynlib_symbol(handle, "malloc", &warned.record));
    EXPECT_EQ(2, warned.code());
    EXPECT_EQ(nullptr, zvdynlib_symbol(handle, "no\tsymbol", &warned.record));
    EXPECT_EQ(-52005, warned.code());
    EXPECT_EQ(
        0U,
        warned.text().find(
            R"({"error_constant":"zvplaterr_invalidParameter","file":"zvdynlib/dynload","line":185,)"
            R"("component":"dravik","zvdynlib_debug":{"zvdynlib_symbol":"no\tsymbol"},)"
            R"("internal_error":{"api":"dlerror","string":")"))
        << warned.text();
    EXPECT_NE(std::string::npos, warned.text().find(R"(undefined symbol: no\tsymbol"}})"));
    EXPECT_EQ(0, zvdynlib_close(handle));
}

} // namespace
