#include "system/KestConfigIni.h"

#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "system/SystemItemSysroot.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

using test::kWebServicePath;
using test::ThrownStatus;

TEST(KestConfigIniTest, ReadsTheSwitchAsLoadedAtConstruction) {
    struct Case {
        const char* content;  // null: no file
        bool enabled;
    };
    const Case cases[] = {
        {nullptr, false},
        {"", false},
        {"[WebService]\n", false},
        {"[WebService]\nEnable = 0\n", false},
        {"[WebService]\nEnable = 1\n", true},
        {"[WebService]\nEnable = 7\n", true},
        {"[WebService]\nEnable = yes\n", false},
        {"[Other]\nEnable = 1\n", false},
    };
    for (const Case& c : cases) {
        kest::test::TempSysroot sysroot;
        if (c.content != nullptr) {
            sysroot.WriteFile(kWebServicePath, c.content);
        }
        KestConfigIni settings;
        EXPECT_EQ(c.enabled, settings.IsWebServiceEnabled()) << (c.content ? c.content : "none");
        sysroot.WriteFile(kWebServicePath, "[WebService]\nEnable = 1\n");
        EXPECT_EQ(c.enabled, settings.IsWebServiceEnabled()) << "the file is read only once";
    }
}

TEST(KestConfigIniTest, WritesTheSwitchAndDropsComments) {
    kest::test::TempSysroot sysroot;
    sysroot.MakeDirectory("/etc/korvane/share");
    KestConfigIni settings;
    settings.SetWebServiceEnabled(true);
    EXPECT_TRUE(settings.IsWebServiceEnabled());
    EXPECT_EQ("[WebService]\nEnable = 1\n\n", sysroot.ReadFile(kWebServicePath));

    sysroot.WriteFile(kWebServicePath, "; managed by the plug-in\n[WebService]\nEnable = 1\n");
    KestConfigIni reloaded;
    reloaded.SetWebServiceEnabled(false);
    EXPECT_FALSE(reloaded.IsWebServiceEnabled());
    EXPECT_EQ("[WebService]\nEnable = 0\n\n", sysroot.ReadFile(kWebServicePath));
}

TEST(KestConfigIniTest, AFailedSaveKeepsTheFileAndForgetsTheChange) {
    kest::test::TempSysroot sysroot;
    sysroot.WriteFile(kWebServicePath, "[WebService]\nEnable = 1\n");
    KestConfigIni settings;
    // The temporary file of the safe replacement cannot be created.
    sysroot.MakeDirectory("/etc/korvane/share/vqkest.TMP");
    EXPECT_EQ(E_FAIL, ThrownStatus([&] { settings.SetWebServiceEnabled(false); }));
    EXPECT_TRUE(settings.IsWebServiceEnabled());
    EXPECT_EQ("[WebService]\nEnable = 1\n", sysroot.ReadFile(kWebServicePath));
}

TEST(KestConfigIniTest, AFailedFirstSaveLeavesTheSwitchDisabled) {
    kest::test::TempSysroot sysroot;
    // The settings directory is a regular file, so nothing can be written below it.
    sysroot.WriteFile("/etc/korvane/share", "");
    KestConfigIni settings;
    EXPECT_EQ(E_FAIL, ThrownStatus([&] { settings.SetWebServiceEnabled(true); }));
    EXPECT_FALSE(settings.IsWebServiceEnabled());
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
