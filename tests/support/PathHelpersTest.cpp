#include "support/PathHelpers.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <ctime>
#include <fstream>

#include <gtest/gtest.h>

#include "common/ChildProcess.h"
#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/ProcessControl.h"
#include "support/Sysroot.h"
#include "support/SystemClock.h"
#include "support/TextConversion.h"

namespace kest::test::support {

namespace {

using namespace vq::dsc::osdep;
using vq::dsc::WideFromNarrow;
namespace exception = vq::dsc::exception;

// A scratch tree with one directory "/dir" and one regular file "/file".
class PathHelpersTest : public ::testing::Test {
  protected:
    void SetUp() override {
        tree_.MakeDirectory("/dir");
        tree_.WriteFile("/file", "content");
    }
    std::string At(const std::string& relative) const { return tree_.PathOf(relative); }
    static mode_t ModeOf(const std::string& path) {
        struct stat status {};
        EXPECT_EQ(stat(path.c_str(), &status), 0) << path;
        return status.st_mode & 07777;
    }
    // Runs `call` and returns the error number of the PosixError it raises (0: none).
    template <class Call>
    static int PosixErrorOf(Call call) {
        try {
            call();
        } catch (const PosixError& error) {
            return error.OSErrorNumber();
        }
        return 0;
    }

    TempSysroot tree_;
};

TEST_F(PathHelpersTest, PathTests) {
    struct Case {
        std::string path;
        bool absolute, directory;
    };
    const Case cases[] = {{At("/dir"), true, true},
                          {At("/dir/"), true, true},
                          {At("/file"), true, false},
                          {At("/missing"), true, false},
                          {At("/file/below"), true, false},
                          {"/", true, true},
                          {"tmp", false, false},
                          {"", false, false}};
    for (const Case& c : cases) {
        EXPECT_EQ(IsAbsolutePath(c.path), c.absolute) << c.path;
        EXPECT_EQ(IsAbsolutePath(WideFromNarrow(c.path)), c.absolute) << c.path;
        EXPECT_EQ(IsDirectory(c.path), c.directory) << c.path;
        EXPECT_EQ(IsDirectory(WideFromNarrow(c.path)), c.directory) << c.path;
    }
}

TEST_F(PathHelpersTest, IsRegularFileSeparatesMissingFromFailure) {
    EXPECT_TRUE(IsRegularFile(WideFromNarrow(At("/file"))));
    EXPECT_FALSE(IsRegularFile(At("/dir")));
    EXPECT_FALSE(IsRegularFile(At("/missing")));
    EXPECT_THROW(IsRegularFile(std::string("file")), exception::InvalidArgument);
    EXPECT_EQ(PosixErrorOf([&] { IsRegularFile(At("/file/below")); }), ENOTDIR);
}

TEST_F(PathHelpersTest, CreateDirectoriesGivesEveryNewComponentTheMode) {
    const mode_t previousMask = umask(022);
    CreateDirectories(At("/a/b//c/"), 0777);
    CreateDirectories(WideFromNarrow(At("/w/x")));
    umask(previousMask);
    for (const char* created : {"/a", "/a/b", "/a/b/c"}) {
        EXPECT_EQ(ModeOf(At(created)), 0777u) << created;
    }
    EXPECT_EQ(ModeOf(At("/w/x")), 0700u);
    chmod(At("/dir").c_str(), 0750);
    EXPECT_NO_THROW(CreateDirectories(At("/dir/new")));
    EXPECT_EQ(ModeOf(At("/dir")), 0750u) << "an existing directory keeps its mode";
    CreateDirectories(At("/shared/tree"), 01777);
    EXPECT_EQ(ModeOf(At("/shared")), 01777u);
    chmod(At("/dir").c_str(), 0777);
    CreateDirectories(At("/dir"), 01777);
    EXPECT_EQ(ModeOf(At("/dir")), 01777u) << "a shared directory of ours gets the sticky bit";
    // A link root placed in a directory only root may write is followed.
    ASSERT_EQ(symlink(At("/dir").c_str(), At("/w/trusted").c_str()), 0);
    EXPECT_NO_THROW(CreateDirectories(At("/w/trusted/below")));
    EXPECT_TRUE(IsDirectory(At("/dir/below")));
}

TEST_F(PathHelpersTest, CreateDirectoriesFailures) {
    EXPECT_THROW(CreateDirectories(std::string("relative/dir")), exception::InvalidArgument);
    EXPECT_EQ(PosixErrorOf([&] { CreateDirectories(At("/file/below")); }), ENOTDIR);
    EXPECT_EQ(PosixErrorOf([&] { CreateDirectories(At("/file")); }), ENOTDIR);
    // What another user may have placed in a directory everyone can write.
    tree_.MakeDirectory("/open/theirs");
    chmod(At("/open").c_str(), 01777);
    ASSERT_EQ(chown(At("/open/theirs").c_str(), 65534, 65534), 0);
    ASSERT_EQ(symlink(At("/dir").c_str(), At("/open/link").c_str()), 0);
    ASSERT_EQ(symlink(At("/dir").c_str(), At("/open/theirlink").c_str()), 0);
    ASSERT_EQ(lchown(At("/open/theirlink").c_str(), 65534, 65534), 0);
    const std::pair<const char*, int> refused[] = {
        {"/open/theirs/below", EPERM}, {"/open/link/below", ELOOP}, {"/open/theirlink", ELOOP}};
    for (const auto& entry : refused) {
        const std::string path = At(entry.first);
        EXPECT_EQ(PosixErrorOf([&] { CreateDirectories(path); }), entry.second) << path;
    }
    EXPECT_FALSE(IsDirectory(At("/dir/below")));

    // Root may write anywhere, so an unprivileged child makes the attempt.
    chmod(tree_.Root().c_str(), 0755);
    chmod(At("/dir").c_str(), 0755);
    const std::string target = At("/dir/denied");
    RunInChild([&target] {
        ASSERT_TRUE(setgid(65534) == 0 && setuid(65534) == 0);
        try {
            CreateDirectories(target);
            ADD_FAILURE() << "created as nobody";
        } catch (const exception::AccessDenied& error) {
            EXPECT_EQ(std::string(error.what()), "Access denied: " + target);
        }
    });
}

// Killing a running program is shown by the external-program time-out tests.
TEST(KillProcessTest, IgnoresProcessesThatAreGoneAndRefusesGroups) {
    // A reaped id might be reused at once; an id above the system's limit never names a process.
    long pidLimit = 0;
    std::ifstream("/proc/sys/kernel/pid_max") >> pidLimit;
    ASSERT_GT(pidLimit, 0);
    EXPECT_NO_THROW(KillProcess(static_cast<pid_t>(pidLimit + 1)));
    for (pid_t processGroup : {0, -1, -getpid()}) {
        EXPECT_THROW(KillProcess(processGroup), exception::InvalidArgument) << processGroup;
    }
}

// An absolute shared-file directory wins over the sysroot: the named mutex tests show it.
TEST(SysrootTest, ResolvesOnlyUnderAnAbsoluteSysroot) {
    const struct {
        const char* value;  // KEST_SYSROOT, null for unset
        const char* prefix;
        bool hasSysroot;
    } cases[] = {{nullptr, "", false},
                 {"", "", false},
                 {"relative/root", "", false},
                 {"/", "", true},
                 {"/srv/root", "/srv/root", true},
                 {"/srv/root//", "/srv/root", true}};
    for (const auto& c : cases) {
        RunInChild([&c] {  // the environment changes end with the child
            SCOPED_TRACE(c.value != nullptr ? c.value : "unset");
            c.value != nullptr ? setenv("KEST_SYSROOT", c.value, 1) : unsetenv("KEST_SYSROOT");
            setenv("VQDSCTMPSHAREDFILEDIR", "run/shared", 1);  // not absolute: ignored
            const std::string prefix = c.prefix;
            EXPECT_EQ(kest::SysrootDirectory(), prefix);
            EXPECT_EQ(kest::HasSysroot(), c.hasSysroot);
            EXPECT_EQ(kest::ResolveSystemPath("/dev/rtc0"), prefix + "/dev/rtc0");
            EXPECT_EQ(kest::ResolveSystemPath("relative/path"), "relative/path");
            namespace paths = kest::paths;
            EXPECT_EQ(paths::VersionFile(), prefix + "/etc/korvane/version");
            EXPECT_EQ(paths::FirmwareStagingFile(),
                      prefix + "/var/volatile/tmp/kestsysxp.fwupdate.cfg");
            EXPECT_EQ(paths::SharedTemporaryFileDirectory(), prefix + "/var/tmp/korvane/shared");
            EXPECT_EQ(paths::NamedMutexDirectory(), prefix + "/var/tmp/korvane/shared/mutex");
            EXPECT_EQ(paths::RealTimeClockDevices(),
                      (std::vector<std::string>{prefix + "/dev/rtc", prefix + "/dev/rtc0",
                                                prefix + "/dev/misc/rtc"}));
        });
    }
}

// Under a sysroot the time goes to a file, replaced whole. 2100-01-01 is taken where time_t has
// 64 bits and refused, never wrapped to 1901, where it has 32 bits (ARMv7 Linux).
TEST(SystemClockTest, UnderASysrootTheTimeGoesToAFile) {
    TempSysroot sysroot;
    EXPECT_THROW(kest::SetSystemClock(1, 1000000), exception::InvalidArgument);
    EXPECT_THROW(kest::SetSystemClock(1, -1), exception::InvalidArgument);
    if (sizeof(time_t) < sizeof(int64_t)) {
        EXPECT_THROW(kest::SetSystemClock(4102444800, 0), exception::OutOfRange);
    }
    EXPECT_FALSE(sysroot.Exists("/run"));
    kest::SetSystemClock(1700000000, 500000);
    EXPECT_EQ(sysroot.ReadFile("/run/kest/system-clock"), "1700000000 500000\n");
    kest::SetSystemClock(5, 0);
    EXPECT_EQ(sysroot.ReadFile("/run/kest/system-clock"), "5 0\n");
    if (sizeof(time_t) >= sizeof(int64_t)) {
        kest::SetSystemClock(4102444800, 0);
        EXPECT_EQ("4102444800 0\n", sysroot.ReadFile("/run/kest/system-clock"));
    }
    EXPECT_EQ(EntriesOf(sysroot.PathOf("/run/kest")).size(), 1u)
        << "no temporary file is left behind";
    TempSysroot other;
    other.WriteFile("/run", "not a directory");
    EXPECT_THROW(kest::SetSystemClock(1, 0), PosixError);
}

}  // namespace

}  // namespace kest::test::support
