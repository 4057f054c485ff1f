// The status record, the exceptions, the guard and the bridge.

#include "support/allocator.h"
#include "support/hostParts.h"
#include "support/tHostStatus.h"
#include "zverr/Exception.h"
#include "zverr/errStatus.h"
#include "zverr/jsonzLookup.h"
#include "zverr/jsonzString.h"
#include "zverr/payload.h"
#include "zverr/tStatusGuard.h"
#include "zverr/tools/exception_errStatus.h"

#include <cstring>
#include <functional>
#include <gtest/gtest.h>
#include <new>
#include <stdexcept>
#include <string>

namespace {

// A record with the standard reallocJson that ends as its owner must end it.
struct tOwnStatus {
    ~tOwnStatus()
    {
        expectBufferForm(record);
        record.reallocJson(&record, 0);
    }
    std::string text() const { return record.json != nullptr ? record.json : "(none)"; }

    zverr_Status record = zverr_emptyStatus();
};

zverr::Exception failureWith(int32_t code, const char* text)
{
    zverr::Exception failure;
    zverr_setCode(&failure.status, code);
    if (text != nullptr) zverr_setJson(&failure.status, text);
    return failure;
}

void bridge(const std::function<void()>& thrower, zverr_Status* status)
{
    try {
        thrower();
    } catch (...) {
        zverr_exceptionToStatus(status);
    }
}

TEST(Status, FirstFailureWinsAndAFailureReplacesAWarning)
{
    const struct {
        int32_t before, set;
        bool taken;
    } rows[] = {{0, 0, false},  {0, -5, true},
                {0, 3, true},   {3, -5, true},
                {3, 4, false},  {3, 0, false},
                {-5, 0, false}, {-5, -6, false},
                {-5, 3, false}, {INT32_MAX, INT32_MIN, true}};
    for (const auto& row : rows) {
        SCOPED_TRACE(testing::Message() << row.before << " <- " << row.set);
        tOwnStatus status;
        zverr_setJson(&status.record, R"({"a":1})");
        char* const buffer = status.record.json;
        status.record.code = row.before;
        EXPECT_EQ(row.taken, zverr_setCode(&status.record, row.set));
        EXPECT_EQ(row.taken ? row.set : row.before, status.record.code);
        EXPECT_EQ(row.taken ? "{}" : R"({"a":1})", status.text());
        EXPECT_EQ(buffer, status.record.json);
        EXPECT_EQ(512U, status.record.capacity);
        expectBufferForm(status.record);
    }
    const long before = allocator::allocations();
    tOwnStatus bare;
    EXPECT_TRUE(zverr_setCode(&bare.record, -1));
    EXPECT_EQ(before, allocator::allocations()) << "a code alone costs no memory";
    EXPECT_EQ(nullptr, bare.record.json);
}

TEST(Status, StandardReallocationSizes)
{
    for (const uint32_t request : {512U, 513U}) {
        const uint32_t capacity = request == 512 ? 512 : 1024;
        tOwnStatus status;
        EXPECT_TRUE(zverr_defaultReallocJson(&status.record, request));
        EXPECT_EQ(capacity, status.record.capacity);
        EXPECT_EQ("{}", status.text());
        expectBufferForm(status.record);
        EXPECT_TRUE(zverr_defaultReallocJson(&status.record, 1)) << "never made smaller";
        EXPECT_EQ(capacity, status.record.capacity);
        EXPECT_FALSE(zverr_defaultReallocJson(&status.record, 0x80000000U));
        EXPECT_FALSE(zverr_defaultReallocJson(&status.record, UINT32_MAX));
        EXPECT_EQ(capacity, status.record.capacity);
        const char* const buffer = status.record.json;
        EXPECT_TRUE(zverr_defaultReallocJson(&status.record, capacity));
        EXPECT_EQ(buffer, status.record.json);
        zverr_setJson(&status.record, "[7]");
        const long before = allocator::liveBlocks();
        EXPECT_TRUE(zverr_defaultReallocJson(&status.record, capacity + 1));
        EXPECT_EQ("[7]", status.text());
        EXPECT_EQ(before, allocator::liveBlocks());
        EXPECT_TRUE(zverr_defaultReallocJson(&status.record, 0));
        EXPECT_EQ(0U, status.record.capacity);
    }
    tOwnStatus empty;
    EXPECT_TRUE(zverr_defaultReallocJson(&empty.record, 0));
}

TEST(Status, TextsGrowTheBufferAtItsEdge)
{
    tOwnStatus status;
    for (const size_t length : {510U, 511U, 3U}) {
        const std::string text(length, 'x');
        EXPECT_TRUE(zverr_setJson(&status.record, text.c_str()));
        EXPECT_EQ(text, status.text());
        EXPECT_EQ(length == 510 ? 512U : 1024U, status.record.capacity);
        expectBufferForm(status.record);
    }
    const std::string tooLong(2000, 'y');
    const allocator::tFailNth failing(1);
    EXPECT_FALSE(zverr_setJson(&status.record, tooLong.c_str()));
    const allocator::tFailNth failingAgain(1);
    EXPECT_FALSE(zverr_defaultReallocJson(&status.record, 2000));
    EXPECT_EQ("xxx", status.text());
}

TEST(Status, TakingMovesBetweenEqualsAndCopiesOtherwise)
{
    tOwnStatus source;
    source.record.code = -7;
    zverr_setJson(&source.record, R"({"a":1})");
    char* const buffer = source.record.json;

    tHostStatus foreign;
    EXPECT_TRUE(zverr_copyStatus(&foreign.record, &source.record));
    EXPECT_EQ(R"({"a":1})", foreign.text());
    EXPECT_EQ(std::vector<uint32_t>{9}, foreign.requests) << "what the text takes, and no more";
    EXPECT_EQ(buffer, source.record.json);

    tOwnStatus target;
    zverr_setJson(&target.record, "{\"warning\":1}");
    target.record.code = 1;
    const long before = allocator::liveBlocks();
    EXPECT_TRUE(zverr_takeStatus(&target.record, &source.record));
    EXPECT_EQ(before - 1, allocator::liveBlocks()) << "the warning's buffer is given back";
    EXPECT_EQ(buffer, target.record.json);
    EXPECT_EQ(512U, target.record.capacity);
    EXPECT_EQ(nullptr, source.record.json);
    EXPECT_EQ(0U, source.record.capacity);
    EXPECT_EQ(-7, source.record.code);
    EXPECT_FALSE(zverr_takeStatus(&source.record, &target.record)) << "a failure is not replaced";
    EXPECT_FALSE(zverr_copyStatus(&source.record, &target.record));
    EXPECT_EQ(buffer, target.record.json);

    tHostStatus taker;
    tHostStatus copier;
    EXPECT_TRUE(zverr_takeStatus(&taker.record, &source.record));
    EXPECT_TRUE(zverr_copyStatus(&copier.record, &source.record));
    EXPECT_EQ("{}", taker.text());
    EXPECT_EQ("(none)", copier.text());
}

TEST(Exception, CarriesItsPayloadAlongAndShowsItAsWhat)
{
    EXPECT_STREQ("", zverr::Exception().what());
    const zverr::Exception original = failureWith(-9, R"({"a":1})");
    EXPECT_STREQ(R"({"a":1})", static_cast<const std::exception&>(original).what());
    const char* const buffer = static_cast<const zverr::ExceptionBase&>(original).what();
    const zverr::Exception copy(original);
    EXPECT_EQ(buffer, copy.what());
    EXPECT_STREQ("", original.what());
    EXPECT_EQ(-9, original.status.code);
    EXPECT_EQ(-9, copy.status.code);
}

TEST(StatusGuard, RaisesFailuresOnlyAndOnlyOutsideAnUnwinding)
{
    const long before = allocator::liveBlocks();
    const char* buffer = nullptr;
    try {
        zverr::tStatusGuard guard;
        zverr_setCode(&guard, -1);
        zverr_setJson(&guard, R"({"a":1})");
        buffer = guard.json;
    } catch (const zverr::Exception& failure) {
        EXPECT_EQ(buffer, failure.what()) << "the very buffer moves, no text is copied";
        EXPECT_EQ(-1, failure.status.code);
        buffer = nullptr;
    }
    EXPECT_EQ(nullptr, buffer) << "it did throw";
    EXPECT_THROW(
        {
            zverr::tStatusGuard guard;
            guard.code = -1; // and no payload
        },
        zverr::Exception);

    EXPECT_NO_THROW({
        zverr::tStatusGuard guard;
        zverr_setCode(&guard, 1);
        zverr_setJson(&guard, R"({"a":1})");
    });
    try {
        zverr::tStatusGuard guard;
        zverr_setCode(&guard, -1);
        zverr_setJson(&guard, R"({"a":1})");
        throw 42;
    } catch (int thrown) {
        EXPECT_EQ(42, thrown);
    }
    EXPECT_EQ(before, allocator::liveBlocks());
}

TEST(StatusGuard, ReleasesABufferThatTheHostPutIn)
{
    static bool throws;
    const zverr_ReallocJsonFn release = [](zverr_Status* status, uint32_t /*size*/) {
        exactReallocJson(status, 0);
        if (throws) throw std::runtime_error("release");
        return true;
    };
    for (const int32_t code : {-3, 0}) {
        for (const bool throwing : {false, true}) {
            throws = throwing;
            const long before = allocator::liveBlocks();
            int32_t raised = 1;
            std::string text;
            try {
                zverr::tStatusGuard guard;
                guard.code = code;
                guard.reallocJson = release;
                exactReallocJson(&guard, 4);
            } catch (const zverr::Exception& failure) {
                raised = failure.status.code;
                text = failure.what();
            }
            EXPECT_EQ(code < 0 ? code : 1, raised);
            EXPECT_EQ(code < 0 ? "{}" : "", text);
            text = std::string();
            EXPECT_EQ(before, allocator::liveBlocks());
        }
    }
}

TEST(Bridge, PutsEveryKindOfExceptionIntoTheHostsStatus)
{
    const auto own = [] { throw failureWith(-8, R"({"a":1})"); };
    const auto bare = [] { throw failureWith(-8, nullptr); };
    const auto memory = [] { throw std::bad_alloc(); };
    const auto standard = [] { throw std::runtime_error("x\n"); };
    const auto number = [] { throw 42; };
    struct tSilent : std::exception {
        const char* what() const noexcept override { return nullptr; }
    };
    const auto silent = [] { throw tSilent(); };
    const char* const warning = R"({"a long warning":"that leaves room"})";
    const char* const text62 =
        R"({"error_constant":"zvplaterr_memoryFull","file":"zverr/tools/exception_errStatus",)"
        R"("line":62,"component":"dravik","std_exception_what":"std::bad_alloc"})";
    const std::string at69 =
        R"({"error_constant":"zvplaterr_softwareFaultPLATInternalUseOnly",)"
        R"("file":"zverr/tools/exception_errStatus","line":69,"component":"dravik",)"
        R"("std_exception_what":")";
    const std::string text69 = at69 + R"(x\n"})";
    const std::string text69Silent = at69 + R"("})";
    const char* const text74 =
        R"({"error_constant":"zvplaterr_softwareFaultPLATInternalUseOnly",)"
        R"("file":"zverr/tools/exception_errStatus","line":74,"component":"dravik"})";
    const struct {
        const char* name;
        std::function<void()> thrower;
        int32_t before;
        const char* textBefore;
        int32_t code;
        std::string text;
        tHostStatus::tMode mode = tHostStatus::kGive;
        uint32_t largest = UINT32_MAX;
    } rows[] = {
        {"own failure", own, 0, nullptr, -8, R"({"a":1})"},
        {"without payload", bare, 0, nullptr, -8, "{}"},
        {"fits over a warning", own, 2, warning, -8, R"({"a":1})"},
        {"refused, no buffer", own, 0, nullptr, -8, "(none)", tHostStatus::kRefuse},
        {"refused, a buffer", own, 2, "{}", -8, "{}", tHostStatus::kRefuse},
        {"granted, not given", own, 2, "{}", -8, "{}", tHostStatus::kGrantNothing},
        {"granted, no buffer", number, 0, nullptr, -52003, "(none)", tHostStatus::kGrantNothing},
        {"what() is null", silent, 0, nullptr, -52003, text69Silent},
        {"reallocJson throws", own, 0, nullptr, -8, "(none)", tHostStatus::kThrow},
        {"older failure stays", own, -1, R"({"b":2})", -1, R"({"b":2})"},
        {"no memory", memory, 0, nullptr, -52000, text62},
        {"no memory for that", memory, 0, nullptr, -52000, "(none)", tHostStatus::kRefuse},
        {"standard exception", standard, 0, nullptr, -52003, text69},
        {"and a throw", standard, 0, nullptr, -52003, "(none)", tHostStatus::kThrow},
        {"anything else", number, 0, nullptr, -52003, text74},
        {"over a warning", number, 2, warning, -52003, text74},
        {"over no JSON", number, 2, "{no JSON", -52003, text74},
        {"what fits exactly", number, 0, nullptr, -52003,
         R"({"error_constant":"zvplaterr_softwareFaultPLATInternalUseOnly"})", tHostStatus::kGive,
         66},
        {"older failure, no JSON", number, -1, "{no", -1, "{no"}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        tHostStatus host(row.before, row.textBefore);
        host.mode = row.mode;
        host.largest = row.largest;
        bridge(row.thrower, &host.record);
        EXPECT_EQ(row.code, host.code());
        EXPECT_EQ(row.text, host.text());
        EXPECT_TRUE(row.before >= 0 || host.requests.empty()) << "nothing to store";
    }
}

TEST(Payload, ReservesABufferAndFindsItsClosingBracket)
{
    const struct {
        const char* text; // null: no buffer yet
        uint32_t extra;
        int bracket;       // -1: null
        uint32_t capacity; // afterwards
        tHostStatus::tMode mode;
    } rows[] = {{nullptr, 2, 1, 4, tHostStatus::kGive},
                {nullptr, 2, -1, 0, tHostStatus::kRefuse},
                {nullptr, 0x7FFFFFFE, -1, 0, tHostStatus::kGive},
                {R"({"a":1})", 2, 6, 9, tHostStatus::kGive},
                {R"({"a":1})", 7, 6, 9, tHostStatus::kGive}, // no matter how full it is
                {R"({"a":1})", 8, 6, 10, tHostStatus::kGive},
                {R"([{}] rest)", 2, 3, 11, tHostStatus::kGive},
                {R"({"a":})", 2, -1, 8, tHostStatus::kGive},
                {R"( {})", 2, -1, 5, tHostStatus::kGive}};
    for (const auto& row : rows) {
        SCOPED_TRACE(testing::Message() << (row.text ? row.text : "none") << " " << row.extra);
        tHostStatus host(1, row.text);
        host.mode = row.mode;
        const char* const bracket = zverr_reserveJson(&host.record, row.extra);
        EXPECT_EQ(row.bracket < 0 ? nullptr : host.record.json + row.bracket, bracket);
        EXPECT_EQ(row.capacity, host.record.capacity);
    }
    tHostStatus full(1, R"({"a":1})");
    zverr_reserveJson(&full.record, 7);
    EXPECT_TRUE(full.requests.empty()) << "what fits exactly is not asked for";
    tOwnStatus own;
    const char* const bracket = zverr_reserveJson(&own.record, 2);
    EXPECT_EQ(own.record.json + 1, bracket);
    EXPECT_EQ(512U, own.record.capacity);
}

TEST(Payload, GrowsByDoublingAndEndsWithAHostThatGrantsNothing)
{
    tOwnStatus own;
    zverr_reserveJson(&own.record, 2);
    for (const uint32_t capacity : {1024U, 2048U}) {
        char* const position = zverr_growJson(own.record.json + 1, &own.record);
        EXPECT_EQ(own.record.json + 1, position);
        EXPECT_EQ(capacity, own.record.capacity);
        expectBufferForm(own.record);
    }
    for (const uint32_t capacity : {0x80000000U, 0x80000002U}) { // the largest, and beyond
        own.record.capacity = capacity;
        EXPECT_EQ(nullptr, zverr_growJson(own.record.json + 1, &own.record));
    }
    own.record.capacity = 2048;

    tHostStatus host(0, "{}");
    host.mode = tHostStatus::kGrantNothing;
    EXPECT_EQ(nullptr, zverr_growJson(host.record.json + 1, &host.record));
    EXPECT_EQ(std::vector<uint32_t>{6}, host.requests);
}

TEST(Payload, WriterStopsAtTheFirstMemberThatDoesNotFit)
{
    tHostStatus host;
    host.largest = 66;
    zverr_JsonWriter writer(&host.record);
    writer.addObject("o").addInt("i", -1).addString("s", std::string("v")).endObject();
    EXPECT_EQ(R"({"o":{"i":-1,"s":"v"}})", host.text());
    writer.addObject("p").addString("long", std::string(40, 'x')).addUInt("u", 1).endObject();
    EXPECT_EQ(R"({"o":{"i":-1,"s":"v"},"p":{}})", host.text());
    EXPECT_EQ(std::vector<uint32_t>({4, 6, 10, 18, 34, 66, 130}), host.requests)
        << "what stopped asks for nothing";
    zverr_JsonWriter().addUInt("u", 1).addObject("o").endObject().addSource({"f", 1, "c"});
    zverr_JsonWriter(&host.record).addSource({"f", 7, nullptr});
    EXPECT_EQ(R"({"o":{"i":-1,"s":"v"},"p":{},"file":"f","line":7})", host.text());
    tHostStatus empty;
    zverr_JsonWriter(&empty.record).addObject("o").endObject().addUInt("u", 1);
    EXPECT_EQ(R"({"o":{},"u":1})", empty.text());
}

TEST(Payload, TakesMegabytesInTimeThatGrowsWithThem)
{
    std::string document(300000, '\x01');
    for (int round = 0; round < 2; ++round) { // escaped twice: 14 characters a byte
        tOwnStatus status;
        zverr_JsonWriter writer(&status.record);
        writer.addString("JSON", document).addString("key", "k");
        uint32_t length = 0;
        const char* const key =
            jsonz_getString(jsonz_findMember(status.record.json, "key"), "", &length, nullptr);
        EXPECT_EQ("k", std::string(key, length));
        const char* const text =
            jsonz_getString(jsonz_findMember(status.record.json, "JSON"), "", &length, nullptr);
        std::string plain(length, ' ');
        ASSERT_NE(nullptr, jsonz_unescape(text, length, plain.data()));
        EXPECT_STREQ(document.c_str(), plain.c_str());
        document.assign(text, length);
    }
}

TEST(Bridge, HandsTheBufferOverToARecordOfTheSameKind)
{
    tOwnStatus status;
    const char* buffer = nullptr;
    bridge(
        [&buffer] {
            const zverr::Exception failure = failureWith(-8, R"({"a":1})");
            buffer = failure.what();
            throw failure;
        },
        &status.record);
    EXPECT_EQ(buffer, status.record.json);
    tOwnStatus bare;
    bridge([] { throw failureWith(-8, nullptr); }, &bare.record);
    EXPECT_EQ(-8, bare.record.code);
    EXPECT_EQ("(none)", bare.text());
}

} // namespace
