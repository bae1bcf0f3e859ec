// Initialize of an expert made without the factory, and the trace mask it leaves.
#include <glob.h>
#include <gtest/gtest.h>

#include <fstream>
#include <string>

#include "com/CVQComObject.h"
#include "common/TempSysroot.h"
#include "expert/KestItemManager.h"
#include "expert/KestSysApiExpert.h"
#include "support/TraceGate.h"
#include "trace/Tracer.h"

namespace kest::test::expert {

namespace {

using nVQKESTSYSAPICHASSISEXPERT100::KestItemManager;
using nVQKESTSYSAPICHASSISEXPERT100::KestSysApiExpert;

TEST(ExpertInitializeTest, FailsWithoutAnItemManager) {
    kest::test::TempSysroot sysroot;
    auto expert = CreateCountedComObject<KestSysApiExpert>();
    EXPECT_EQ(E_FAIL, expert->Initialize());
    EXPECT_FALSE(sysroot.Exists("/var/local/korvane/vqsyslog"));
}

TEST(ExpertInitializeTest, WithoutSettingsFileTracesIniCacheFailuresToTheLogFile) {
    kest::test::TempSysroot sysroot;
    auto expert = CreateCountedComObject<KestSysApiExpert>();
    ASSERT_EQ(S_OK, expert->SetItemManager(ItemManagerBase::GetInstance<KestItemManager>(true)));
    EXPECT_EQ(S_FALSE, expert->SetItemManager(ItemManagerBase::GetInstance<KestItemManager>(true)));
    ASSERT_EQ(S_OK, expert->Initialize());
    EXPECT_EQ(1u, GetTraceMask());
    TraceIfEnabled("probe", kTraceIniCache);
    EXPECT_EQ(S_OK, expert->Uninitialize());

    glob_t logs{};
    const std::string pattern = sysroot.PathOf("/var/local/korvane/vqsyslog/*-uxTracer-*.log");
    ASSERT_EQ(0, glob(pattern.c_str(), 0, nullptr, &logs));
    EXPECT_EQ(1u, logs.gl_pathc);
    std::ifstream log(logs.gl_pathv[0]);
    std::string firstLine;
    std::getline(log, firstLine);
    EXPECT_EQ("  probe", firstLine);
    globfree(&logs);
}

}  // namespace

}  // namespace kest::test::expert
