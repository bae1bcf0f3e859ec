#include "support/PathHelpers.h"

#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>

#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/ProcessControl.h"
#include "support/TextConversion.h"

namespace {

using namespace vq::dsc::osdep;
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

    kest::test::TempSysroot tree_;
};

TEST(IsAbsolutePathTest, OnlyALeadingSlashCounts) {
    const std::pair<const char*, bool> cases[] = {{"/", true},    {"/etc", true},
                                                  {"etc", false}, {"./etc", false},
                                                  {"", false},    {" /etc", false}};
    for (const auto& [path, absolute] : cases) {
        EXPECT_EQ(IsAbsolutePath(std::string(path)), absolute) << path;
        EXPECT_EQ(IsAbsolutePath(vq::dsc::WideFromNarrow(path)), absolute) << path;
    }
}

TEST_F(PathHelpersTest, IsDirectoryIsTrueOnlyForExistingDirectories) {
    const std::pair<std::string, bool> cases[] = {{At("/dir"), true},
                                                  {At("/dir/"), true},
                                                  {At("/file"), false},
                                                  {At("/missing"), false},
                                                  {At("/file/below"), false},
                                                  {"tmp", false},
                                                  {"", false}};
    for (const auto& [path, expected] : cases) {
        EXPECT_EQ(IsDirectory(path), expected) << path;
        EXPECT_EQ(IsDirectory(vq::dsc::WideFromNarrow(path)), expected) << path;
    }
}

TEST_F(PathHelpersTest, IsRegularFileSeparatesMissingFromFailure) {
    EXPECT_TRUE(IsRegularFile(At("/file")));
    EXPECT_TRUE(IsRegularFile(vq::dsc::WideFromNarrow(At("/file"))));
    EXPECT_FALSE(IsRegularFile(At("/dir")));
    EXPECT_FALSE(IsRegularFile(At("/missing")));
    EXPECT_THROW(IsRegularFile(std::string("file")), exception::InvalidArgument);
    EXPECT_THROW(IsRegularFile(std::wstring(L"file")), exception::InvalidArgument);
    try {
        IsRegularFile(At("/file/below"));
        FAIL() << "a path through a regular file must fail";
    } catch (const PosixError& error) {
        EXPECT_EQ(error.OSErrorNumber(), ENOTDIR);
    }
}

TEST_F(PathHelpersTest, CreateDirectoriesGivesEveryNewComponentTheMode) {
    const mode_t previousMask = umask(022);
    CreateDirectories(At("/a/b//c/"), 0777);
    CreateDirectories(vq::dsc::WideFromNarrow(At("/w/x")));
    umask(previousMask);
    EXPECT_EQ(ModeOf(At("/a")), 0777u);
    EXPECT_EQ(ModeOf(At("/a/b")), 0777u);
    EXPECT_EQ(ModeOf(At("/a/b/c")), 0777u);
    EXPECT_EQ(ModeOf(At("/w/x")), 0700u);
    // Existing directories are accepted and keep their mode.
    chmod(At("/dir").c_str(), 0750);
    EXPECT_NO_THROW(CreateDirectories(At("/dir/new"), 0700));
    EXPECT_EQ(ModeOf(At("/dir")), 0750u);
    EXPECT_TRUE(IsDirectory(At("/dir/new")));
}

TEST_F(PathHelpersTest, CreateDirectoriesFailures) {
    EXPECT_THROW(CreateDirectories(std::string("relative/dir")), exception::InvalidArgument);
    for (const std::string& path : {At("/file/below"), At("/file")}) {
        try {
            CreateDirectories(path);
            FAIL() << path << " cannot become a directory";
        } catch (const PosixError& error) {
            EXPECT_EQ(error.OSErrorNumber(), ENOTDIR) << path;
        }
    }
}

TEST_F(PathHelpersTest, CreateDirectoriesReportsRefusedPermission) {
    chmod(tree_.Root().c_str(), 0755);
    chmod(At("/dir").c_str(), 0755);
    const std::string target = At("/dir/denied");
    // Root may write anywhere, so an unprivileged child makes the attempt.
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        if (setgid(65534) != 0 || setuid(65534) != 0) {
            _exit(2);
        }
        try {
            CreateDirectories(target);
        } catch (const exception::AccessDenied& error) {
            _exit(std::string(error.what()) == "Access denied: " + target ? 0 : 3);
        } catch (...) {
            _exit(4);
        }
        _exit(5);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status));
    EXPECT_EQ(WEXITSTATUS(status), 0);
}

TEST(KillProcessTest, KillsRunningAndAcceptsVanishedProcesses) {
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        pause();
        _exit(0);
    }
    KillProcess(child);
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL);
    // A reaped id might be reused at once; an id above the system's limit never names a process.
    long pidLimit = 0;
    std::ifstream("/proc/sys/kernel/pid_max") >> pidLimit;
    ASSERT_GT(pidLimit, 0);
    EXPECT_NO_THROW(KillProcess(static_cast<pid_t>(pidLimit + 1)));
}

TEST(KillProcessTest, RefusesProcessGroupIds) {
    for (pid_t pid : {0, -1, -getpid()}) {
        EXPECT_THROW(KillProcess(pid), vq::dsc::exception::InvalidArgument) << pid;
    }
}

}  // namespace
