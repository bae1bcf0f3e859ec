#include "system/KestConfigIni.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <string>

#include "common/ChildProcess.h"
#include "common/StatusOf.h"
#include "common/TempSysroot.h"
#include "support/ExclusiveFileLock.h"
#include "system/SystemItemSysroot.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

using kest::test::StatusOf;
using kest::test::system::kWebServicePath;

constexpr char kEnabledFile[] = "[WebService]\nEnable = 1\n\n";
constexpr char kDisabledFile[] = "[WebService]\nEnable = 0\n\n";

// Replaces the settings file as another process's save does: a new file renamed over it.
void ReplaceSettings(const kest::test::TempSysroot& sysroot, const std::string& content) {
    sysroot.WriteFile("/etc/korvane/share/other.new", content);
    ASSERT_EQ(0, std::rename(sysroot.PathOf("/etc/korvane/share/other.new").c_str(),
                             sysroot.PathOf(kWebServicePath).c_str()));
}

TEST(KestConfigIniTest, ReadsTheSwitchAsTheFileHoldsIt) {
    // The file's content (null: no file) and whether the switch is on.
    const std::pair<const char*, bool> cases[] = {
        {nullptr, false},
        {"", false},
        {"[WebService]\n", false},
        {"[WebService]\nEnable = 0\n", false},
        {"[WebService]\nEnable = 1\n", true},
        {"[WebService]\nEnable = 7\n", true},
        {"[WebService]\nEnable = yes\n", false},
        {"[Other]\nEnable = 1\n", false},
    };
    for (const auto& [content, enabled] : cases) {
        kest::test::TempSysroot sysroot;
        if (content != nullptr) {
            sysroot.WriteFile(kWebServicePath, content);
        }
        KestConfigIni settings;
        EXPECT_EQ(enabled, settings.IsWebServiceEnabled()) << (content ? content : "none");
        sysroot.MakeDirectory("/etc/korvane/share");
        ReplaceSettings(sysroot, enabled ? kDisabledFile : kEnabledFile);
        EXPECT_EQ(!enabled, settings.IsWebServiceEnabled()) << "a change on disk is seen";
        ASSERT_EQ(0, unlink(sysroot.PathOf(kWebServicePath).c_str()));
        EXPECT_FALSE(settings.IsWebServiceEnabled()) << "a removed file reads as disabled";
    }
}

// A settings file that exists but cannot be read (another encoding, a directory, a FIFO that
// would block a reader) is refused and left as it is; once readable again, saving works.
TEST(KestConfigIniTest, AFileThatCannotBeReadIsNeverOverwritten) {
    const std::string utf16("\xFF\xFE[\0W\0]\0", 8);
    for (const std::string kind : {"utf16", "directory", "fifo"}) {
        kest::test::TempSysroot sysroot;
        const std::string path = sysroot.PathOf(kWebServicePath);
        sysroot.WriteFile(kWebServicePath, utf16);
        if (kind != "utf16") {
            ASSERT_EQ(0, unlink(path.c_str()));
            ASSERT_EQ(0, kind == "fifo" ? mkfifo(path.c_str(), 0600) : mkdir(path.c_str(), 0700));
        }
        KestConfigIni settings;
        EXPECT_FALSE(settings.IsWebServiceEnabled()) << kind;
        EXPECT_EQ(E_FAIL, StatusOf([&] { settings.SetWebServiceEnabled(true); })) << kind;
        struct stat status;
        ASSERT_EQ(0, lstat(path.c_str(), &status));
        EXPECT_EQ(kind == "utf16"  ? S_IFREG
                  : kind == "fifo" ? S_IFIFO
                                   : S_IFDIR,
                  status.st_mode & S_IFMT);
        if (kind == "utf16") {
            EXPECT_EQ(utf16, sysroot.ReadFile(kWebServicePath));
        }
        ASSERT_EQ(0, std::remove(path.c_str()));
        sysroot.WriteFile(kWebServicePath, "; comment\n[Other]\nKey = x\n[WebService]\n");
        settings.SetWebServiceEnabled(true);
        EXPECT_TRUE(settings.IsWebServiceEnabled());
        // The other section stays, comments do not.
        EXPECT_EQ("[Other]\nKey = x\n\n[WebService]\nEnable = 1\n\n",
                  sysroot.ReadFile(kWebServicePath));
        settings.SetWebServiceEnabled(false);
        EXPECT_FALSE(settings.IsWebServiceEnabled());
    }
}

TEST(KestConfigIniTest, AFailedSaveKeepsTheFileAndForgetsTheChange) {
    kest::test::TempSysroot sysroot;
    sysroot.WriteFile(kWebServicePath, kEnabledFile);
    // No file may grow in the child, so the temporary cannot be written.
    kest::test::RunInChild([] {
        signal(SIGXFSZ, SIG_IGN);
        rlimit limit{0, 0};
        setrlimit(RLIMIT_FSIZE, &limit);
        KestConfigIni settings;
        EXPECT_EQ(E_FAIL, StatusOf([&] { settings.SetWebServiceEnabled(false); }));
        EXPECT_TRUE(settings.IsWebServiceEnabled());
    });
    EXPECT_EQ(kEnabledFile, sysroot.ReadFile(kWebServicePath));
    // A first save that fails (the settings directory is a regular file) leaves it disabled.
    kest::test::TempSysroot blocked;
    blocked.WriteFile("/etc/korvane/share", "");
    KestConfigIni settings;
    EXPECT_EQ(E_FAIL, StatusOf([&] { settings.SetWebServiceEnabled(true); }));
    EXPECT_FALSE(settings.IsWebServiceEnabled());
}

// A save waits while another process holds the turn, and then saves into what that process left.
TEST(KestConfigIniTest, SavesOfSeveralProcessesTakeTurns) {
    kest::test::TempSysroot sysroot;
    sysroot.MakeDirectory("/etc/korvane/share");
    int ready[2];
    ASSERT_EQ(0, pipe(ready));
    const pid_t holder = fork();
    if (holder == 0) {
        vq::dsc::osdep::ExclusiveFileLock turn(sysroot.PathOf(kWebServicePath) + ".lock");
        char byte = 'r';
        (void)!write(ready[1], &byte, 1);
        usleep(200000);  // a save that does not wait for the turn finishes meanwhile
        ReplaceSettings(sysroot, "[Other]\nKey = x\n");
        _exit(0);
    }
    char byte = 0;
    ASSERT_EQ(1, read(ready[0], &byte, 1));
    KestConfigIni settings;
    settings.SetWebServiceEnabled(true);
    int status = 0;
    ASSERT_EQ(holder, waitpid(holder, &status, 0));
    close(ready[0]);
    close(ready[1]);
    EXPECT_EQ("[Other]\nKey = x\n\n[WebService]\nEnable = 1\n\n",
              sysroot.ReadFile(kWebServicePath));
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
