// The platform layer: mutex, fixed record, memory.

#include "support/allocator.h"
#include "support/tHostStatus.h"
#include "zverr/Exception.h"
#include "zvplat/protons/cppNewDelete/memoryAllocation.h"
#include "zvplat/quarks/synchronization.h"
#include "zvplat/tFixedStatusAdapter.h"
#include "zvplat/tFixedStatusGuard.h"

#include <atomic>
#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <thread>

namespace {

using zvplat::tFixedStatus;

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
    struct Row {
        std::string component, file, keptComponent, keptFile;
    };
    const Row rows[] = {
        {"dravik", "unit", "dravik", "unit"},
        {"123456789", start + "12" + end, "123456789", start + "12" + end},
        {"123456789A", start + "123" + end, "123456789", start + ".." + end},
        {"", start + std::string(300, '-') + end, "", start + ".." + end},
    };
    tFixedStatus reused;
    for (const Row& row : rows) {
        reused.code = 2; // a failure replaces a warning and all of its text
        EXPECT_TRUE(reused.set(-5, row.component.c_str(), row.file.c_str(), 7));
        EXPECT_EQ(-5, reused.code);
        EXPECT_EQ(row.keptComponent, reused.component);
        EXPECT_EQ(row.keptFile, reused.file);
        EXPECT_EQ(7U, reused.line);
        EXPECT_FALSE(reused.set(-6, "other", "other", 8));
        EXPECT_EQ(row.keptFile, reused.file);
        EXPECT_EQ(-5, reused.code);
        for (size_t i = row.keptFile.size(); i < sizeof reused.file; ++i) {
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
    struct Row {
        const char* name;
        int32_t code;
        const char* component;
        std::string file;
        int32_t before;
        const char* textBefore;
        int32_t after;
        const char* text;
        bool refuses = false;
    };
    const Row rows[] = {
        {"all", -5, "c", "f", 0, nullptr, -5, R"({"file":"f","line":7,"component":"c"})"},
        {"a warning", 5, "c", "", 0, nullptr, 5, R"({"component":"c"})"},
        {"bare", -5, "", "", 0, nullptr, -5, "(none)"},
        {"nothing", 0, "c", "f", 0, nullptr, 0, "(none)"},
        {"over a warning", -5, "", "f", 2, R"({"w":1})", -5, R"({"file":"f","line":7})"},
        {"under a failure", -5, "c", "f", -1, R"({"w":1})", -1, R"({"w":1})"},
        {"no memory", -5, "c", "f", 0, nullptr, -5, "(none)", true},
        {"too long a file", -5, "c", escapes, 0, nullptr, -5, R"({"component":"c"})"},
    };
    for (const Row& row : rows) {
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
    struct Row {
        const char* name;
        int32_t code;
        std::string text;
        std::string component, file;
        uint32_t line;
    };
    const Row rows[] = {
        {"all", -5, R"({"component":"abc","file":"f","line":7})", "abc", "f", 7},
        {"a warning", 5, R"({"line":-1})", "", "", UINT32_MAX},
        {"long names", -5,
         R"({"component":"0123456789","file":"xy)" + std::string(99, 'f') + R"("})", "123456789",
         "y" + std::string(99, 'f'), 0},
        {"cut in an escape", -5, R"({"component":"\u0041b\n34567"})", "1b\n34567", "", 0},
        {"cut to a bad one", -5, R"({"component":"12\\u56x8901","file":"f"})", "", "f", 0},
        {"bad behind good", -5, R"({"component":"ab\u0000c"})", "ab", "", 0},
        {"other types", -5, R"({"component":1,"file":null,"line":"7"})", "", "", 0},
        {"no JSON", -5, R"({"line":7,"component":)", "", "", 7},
        {"no object", -5, R"(["component","c"])", "", "", 0},
        {"no failure", 0, R"({"component":"abc","file":"f","line":7})", "", "", 0},
    };
    for (const Row& row : rows) {
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
    const allocator::tFailNth failing(1);
    EXPECT_EQ(nullptr, arrayFor(&warned.record));
    EXPECT_EQ(-52000, warned.code());
    EXPECT_EQ(R"({"file":"zvplat/protons/cppNewDelete/memoryAllocation","line":346,)"
              R"("component":"dravik"})",
              warned.text());
}

} // namespace
