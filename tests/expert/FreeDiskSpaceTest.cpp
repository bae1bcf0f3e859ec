// The free-space measurement behind PrepareFirmwareUpdate.
#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "expert/FreeDiskSpace.h"

namespace {

using nVQKESTSYSAPICHASSISEXPERT100::GetFreeDiskSpace;

TEST(FreeDiskSpaceTest, MeasuresTheFileSystemOfAnExistingPath) {
    kest::test::TempSysroot sysroot;
    uint64_t total = 0;
    uint64_t free = 0;
    ASSERT_EQ(0, GetFreeDiskSpace(sysroot.Root().c_str(), &total, &free));
    EXPECT_GT(total, 0u);
    EXPECT_LE(free, total);
    uint64_t freeOnly = 0;
    EXPECT_EQ(0, GetFreeDiskSpace(sysroot.Root().c_str(), nullptr, &freeOnly));
    EXPECT_GT(freeOnly, 0u);
    EXPECT_EQ(0, GetFreeDiskSpace(sysroot.Root().c_str(), &total, nullptr));
}

TEST(FreeDiskSpaceTest, RefusesMissingArgumentsAndUnreadablePaths) {
    kest::test::TempSysroot sysroot;
    sysroot.WriteFile("/file", "");
    uint64_t total = 7;
    uint64_t free = 7;
    EXPECT_EQ(-1, GetFreeDiskSpace(nullptr, &total, &free));
    EXPECT_EQ(-1, GetFreeDiskSpace(sysroot.Root().c_str(), nullptr, nullptr));
    EXPECT_EQ(-1, GetFreeDiskSpace(sysroot.PathOf("/missing").c_str(), &total, &free));
    EXPECT_EQ(-1, GetFreeDiskSpace(sysroot.PathOf("/file/below").c_str(), &total, &free));
    EXPECT_EQ(7u, total);
    EXPECT_EQ(7u, free);
}

}  // namespace
