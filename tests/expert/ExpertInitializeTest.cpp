// Initialize of an expert made without the factory, and the trace mask it leaves.
#include <gtest/gtest.h>

#include "com/CVQComObject.h"
#include "common/TempSysroot.h"
#include "expert/KestItemManager.h"
#include "expert/KestSysApiExpert.h"
#include "trace/Tracer.h"

namespace {

using nVQKESTSYSAPICHASSISEXPERT100::KestItemManager;
using nVQKESTSYSAPICHASSISEXPERT100::KestSysApiExpert;

TEST(ExpertInitializeTest, FailsWithoutAnItemManager) {
    kest::test::TempSysroot sysroot;
    auto expert = CreateCountedComObject<KestSysApiExpert>();
    EXPECT_EQ(E_FAIL, expert->Initialize());
    EXPECT_FALSE(sysroot.Exists("/var/local/korvane/vqsyslog"));
}

TEST(ExpertInitializeTest, WithoutSettingsFileTracesFailuresOfTheIniCacheOnly) {
    kest::test::TempSysroot sysroot;
    auto expert = CreateCountedComObject<KestSysApiExpert>();
    ASSERT_EQ(S_OK, expert->SetItemManager(ItemManagerBase::GetInstance<KestItemManager>(true)));
    EXPECT_EQ(S_FALSE, expert->SetItemManager(ItemManagerBase::GetInstance<KestItemManager>(true)));
    ASSERT_EQ(S_OK, expert->Initialize());
    EXPECT_EQ(1u, GetTraceMask());
    EXPECT_EQ(S_OK, expert->Uninitialize());
}

}  // namespace
