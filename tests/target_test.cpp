// What holds only where a pointer has 32 bits, as on the target.

#include "locations/tManagerFileLocations.h"
#include "support/allocator.h"
#include "support/tHostStatus.h"
#include "zvckmservo/servo.h"
#include "zverr/jsonzParser.h"
#include "zverr/jsonzString.h"
#include "zverr/jsonzWriter.h"
#include "zvhostq/stdpath_table.h"
#include "zvhostq/stdpath_util.h"
#include "zvplat/tFixedStatus.h"
#include "zvsdbg/debugLine.h"

#include <cstddef>
#include <cstdio>
#include <fstream>
#include <gtest/gtest.h>
#include <string>
#include <unistd.h>

namespace {

using tBytes = zvktl::err::vector<char>;
using tEntries = zvktl::err::vector<zvhostq::stdpath_entry>;

TEST(Target, PutsEachFieldInItsPlace)
{
    struct Row {
        const char* name;
        size_t expected, found;
    };
#define FIELD(record, field, place)                                                                \
    {                                                                                              \
#record "::" #field, place, offsetof(record, field)                                        \
    }
#define SIZE(record, bytes)                                                                        \
    {                                                                                              \
#record, bytes, sizeof(record)                                                             \
    }
    const Row rows[] = {
        FIELD(zvckmservo_HostTable, servoHandle, 0),
        FIELD(zvckmservo_HostTable, getTime, 52),
        FIELD(zvckmservo_HostTable, stepTime, 56),
        FIELD(zvckmservo_HostTable, getFrequency, 60),
        FIELD(zvckmservo_HostTable, setFrequency, 64),
        FIELD(zvckmservo_HostTable, getMaxFrequencyOffset, 68),
        FIELD(zvckmservo_HostTable, getMinFrequencyOffset, 72),
        SIZE(zvckmservo_HostTable, 76),
        FIELD(zverr_Status, code, 0),
        FIELD(zverr_Status, capacity, 4),
        FIELD(zverr_Status, reallocJson, 8),
        FIELD(zverr_Status, json, 12),
        SIZE(zverr_Status, 16),
        FIELD(zvplat::tFixedStatus, size, 0),
        FIELD(zvplat::tFixedStatus, code, 4),
        FIELD(zvplat::tFixedStatus, component, 8),
        FIELD(zvplat::tFixedStatus, file, 18),
        FIELD(zvplat::tFixedStatus, line, 120),
        FIELD(zvplat::tFixedStatus, reserved, 124),
        SIZE(zvplat::tFixedStatus, 128),
        FIELD(jsonz_Grower, grow, 0),
        FIELD(jsonz_Grower, context, 4),
        FIELD(jsonz_Token, type, 0),
        FIELD(jsonz_Token, start, 4),
        FIELD(jsonz_Token, length, 8),
        FIELD(jsonz_Token, isFloat, 12),
        SIZE(jsonz_Token, 16),
        FIELD(jsonz_StringReader, pending, 0),
        FIELD(jsonz_StringReader, remaining, 4),
        FIELD(jsonz_StringReader, cursor, 8),
        FIELD(tDebugLocation, file, 0),
        FIELD(tDebugLocation, line, 4),
        FIELD(tDebugLocation, lineEnd, 8),
        FIELD(tBytes, capacity, 0),
        FIELD(tBytes, size, 4),
        FIELD(tBytes, data, 8),
        FIELD(zvhostq::stdpath_entry, name, 0),
        FIELD(zvhostq::stdpath_entry, value, 12),
        SIZE(zvhostq::stdpath_entry, 24),
    };
#undef FIELD
#undef SIZE
    for (const Row& row : rows) {
        EXPECT_EQ(row.expected, row.found) << row.name;
    }
}

TEST(Target, AsksForTheLargestVectorThatCanBe)
{
    tHostStatus status;
    status.mode = tHostStatus::kRefuse;
    tEntries entries;
    bool tried = false;
    {
        const allocator::tFailNth first(1);
        entries.open_gap(0, 178956970, &status.record); // 4294967280 bytes
        tried = first.fired();
    }
    EXPECT_TRUE(tried);
    EXPECT_EQ(-52000, status.code());
}

TEST(Target, RefusesAFileBeyondTwoGigabytes)
{
    const std::string path = testing::TempDir() + "dravik_large_" + std::to_string(getpid());
    std::ofstream(path) << "abc";
    ASSERT_EQ(0, truncate64(path.c_str(), 2147483648)); // a hole
    tHostStatus status;
    tBytes content;
    zvhostq::read_whole_file(path.c_str(), &content, &status.record);
    (void)std::remove(path.c_str());
    EXPECT_EQ(0U, content.size);
    // A kernel of 32 bits already refuses to open it, an emulator's of 64 bits opens it.
    EXPECT_TRUE(status.code() == -52006 || status.code() == -52008) << status.code();
    const std::string reason =
        R"({"api":"errno","code":75,"string":"Value too large for defined data type"})";
    EXPECT_NE(std::string::npos, status.text().find(reason)) << status.text();
}

} // namespace
