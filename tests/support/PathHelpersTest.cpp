#include "support/PathHelpers.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <fstream>

#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/ProcessControl.h"
#include "support/TextConversion.h"
#include "trace/TraceTestSupport.h"

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

    kest::test::TempSysroot tree_;
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
    kest::test::trace::RunInChild([&target] {
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

}  // namespace

}  // namespace kest::test::support
