// What holds only where a pointer has 32 bits, as on the target.

#include "support/allocator.h"
#include "support/tHostStatus.h"
#include "zvhostq/stdpath_table.h"
#include "zvhostq/stdpath_util.h"

#include <cstdio>
#include <fstream>
#include <gtest/gtest.h>
#include <string>
#include <unistd.h>

namespace {

using tBytes = zvktl::err::vector<char>;
using tEntries = zvktl::err::vector<zvhostq::stdpath_entry>;

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
