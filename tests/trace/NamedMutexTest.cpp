#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>

#include "TraceTestSupport.h"
#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "trace/NamedMutex.h"

using kest::test::TempSysroot;
using vq::dsc::NamedMutex;

namespace {

mode_t ModeOf(const std::string& path) {
    struct stat status;
    EXPECT_EQ(lstat(path.c_str(), &status), 0) << path;
    return status.st_mode & 07777;
}

// True when another open file description of `path` could take the exclusive file lock now.
bool FileLockIsFree(const std::string& path) {
    int descriptor = open(path.c_str(), O_RDWR | O_CLOEXEC);
    bool free = flock(descriptor, LOCK_EX | LOCK_NB) == 0;
    close(descriptor);
    return free;
}

TEST(NamedMutexTest, LockFileLivesInTheSharedDirectoryWithOpenModes) {
    TempSysroot sysroot;
    mode_t previousMask = umask(022);
    {
        NamedMutex mutex("modes.lock");
        EXPECT_EQ(mutex.LockFilePath(), sysroot.PathOf("/var/tmp/korvane/shared/mutex/modes.lock"));
        EXPECT_EQ(ModeOf(mutex.LockFilePath()), 0666u);
        EXPECT_EQ(ModeOf(sysroot.PathOf("/var/tmp/korvane/shared/mutex")), 0777u);
    }
    umask(previousMask);
    TempSysroot shared;
    setenv("VQDSCTMPSHAREDFILEDIR", shared.Root().c_str(), 1);
    NamedMutex elsewhere("elsewhere.lock");
    unsetenv("VQDSCTMPSHAREDFILEDIR");
    EXPECT_EQ(elsewhere.LockFilePath(), shared.Root() + "/mutex/elsewhere.lock");
}

TEST(NamedMutexTest, AnythingButAPlainRegularFileIsRefused) {
    TempSysroot sysroot;
    std::string directory = sysroot.PathOf("/var/tmp/korvane/shared/mutex");
    sysroot.MakeDirectory("/var/tmp/korvane/shared/mutex");
    std::string victim = sysroot.PathOf("/victim");
    sysroot.WriteFile("/victim", "secret");
    ASSERT_EQ(chmod(victim.c_str(), 0600), 0);
    ASSERT_EQ(symlink(victim.c_str(), (directory + "/symlink.lock").c_str()), 0);
    ASSERT_EQ(link(victim.c_str(), (directory + "/hardlink.lock").c_str()), 0);
    ASSERT_EQ(mkfifo((directory + "/fifo.lock").c_str(), 0666), 0);
    ASSERT_EQ(mkdir((directory + "/directory.lock").c_str(), 0777), 0);
    for (const char* name : {"symlink.lock", "hardlink.lock", "fifo.lock", "directory.lock"}) {
        EXPECT_THROW(NamedMutex mutex(name), vq::dsc::osdep::PosixError) << name;
    }
    EXPECT_EQ(ModeOf(victim), 0600u);
    EXPECT_THROW(NamedMutex mutex("../escape"), vq::dsc::exception::InvalidArgument);
    TempSysroot blocked;
    blocked.WriteFile("/var/tmp/korvane/shared/mutex", "a file where the directory belongs");
    EXPECT_THROW(NamedMutex mutex("blocked.lock"), vq::dsc::osdep::PosixError);
}

TEST(NamedMutexTest, FileLockIsHeldUntilTheOutermostUnlock) {
    TempSysroot sysroot;
    NamedMutex mutex("recursive.lock");
    NamedMutex sameName("recursive.lock");
    mutex.Lock();
    sameName.Lock();
    EXPECT_FALSE(FileLockIsFree(mutex.LockFilePath()));
    sameName.Unlock();
    EXPECT_FALSE(FileLockIsFree(mutex.LockFilePath()));
    mutex.Unlock();
    EXPECT_TRUE(FileLockIsFree(mutex.LockFilePath()));
}

}  // namespace
