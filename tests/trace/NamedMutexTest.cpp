#include <fcntl.h>
#include <signal.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>
#include <string>

#include "common/ChildProcess.h"
#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "trace/NamedMutex.h"

namespace kest::test::trace {

using vq::dsc::NamedMutex;
using vq::dsc::ScopedNamedLock;

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

// Starts `body` in a child that has given up root for nobody; its exit code is body's result.
pid_t StartAsNobody(const std::function<int()>& body) {
    const pid_t child = fork();
    if (child == 0) {
        if (setgid(65534) != 0 || setuid(65534) != 0) {
            _exit(100);
        }
        _exit(body());
    }
    return child;
}

// A sysroot whose shared temporary directory others may write, as on the controller.
class SharedSysroot : public TempSysroot {
  public:
    SharedSysroot() {
        chmod(Root().c_str(), 0755);
        MakeDirectory("/var/tmp");
        chmod(PathOf("/var/tmp").c_str(), 01777);
        WriteFile("/victim", "secret");
        chmod(PathOf("/victim").c_str(), 0600);
    }
};

TEST(NamedMutexTest, LockFileIsPrivateSharedByNameAndHeldUntilTheOutermostUnlock) {
    TempSysroot sysroot;
    const mode_t previousMask = umask(022);
    {
        NamedMutex mutex("modes.lock");
        NamedMutex sameName("modes.lock");
        const std::string path = mutex.LockFilePath();
        EXPECT_EQ(path, sysroot.PathOf("/var/tmp/korvane/shared/mutex/modes.lock"));
        EXPECT_EQ(ModeOf(path), 0600u);
        EXPECT_TRUE(mutex.HasFileLock());
        for (const char* directory :
             {"/var/tmp/korvane", "/var/tmp/korvane/shared", "/var/tmp/korvane/shared/mutex"}) {
            EXPECT_EQ(ModeOf(sysroot.PathOf(directory)), 01777u) << directory;
        }
        mutex.Lock();
        sameName.Lock();
        EXPECT_FALSE(FileLockIsFree(path));
        sameName.Unlock();
        EXPECT_FALSE(FileLockIsFree(path));
        mutex.Unlock();
        EXPECT_TRUE(FileLockIsFree(path));
    }
    umask(previousMask);
    EXPECT_FALSE(sysroot.Exists("/var/tmp/korvane/shared/mutex/modes.lock"));
    // A process without standard input gets descriptor 0 for the lock file.
    const int input = dup(STDIN_FILENO);
    close(STDIN_FILENO);
    EXPECT_TRUE(NamedMutex("zero.lock").HasFileLock());
    dup2(input, STDIN_FILENO);
    close(input);
    TempSysroot shared;
    setenv("VQDSCTMPSHAREDFILEDIR", shared.Root().c_str(), 1);
    NamedMutex elsewhere("elsewhere.lock");
    unsetenv("VQDSCTMPSHAREDFILEDIR");
    EXPECT_EQ(elsewhere.LockFilePath(), shared.Root() + "/mutex/elsewhere.lock");
}

TEST(NamedMutexTest, OnlyOurOwnPlainFileGivesAFileLock) {
    SharedSysroot sysroot;
    std::string directory = sysroot.PathOf("/var/tmp/korvane/shared/mutex");
    std::string victim = sysroot.PathOf("/victim");
    { NamedMutex create("create.lock"); }
    ASSERT_EQ(symlink(victim.c_str(), (directory + "/symlink.lock").c_str()), 0);
    ASSERT_EQ(link(victim.c_str(), (directory + "/hardlink.lock").c_str()), 0);
    ASSERT_EQ(mkfifo((directory + "/fifo.lock").c_str(), 0666), 0);
    ASSERT_EQ(mkdir((directory + "/directory.lock").c_str(), 0777), 0);
    RunInChild([&directory] {
        ASSERT_TRUE(setgid(65534) == 0 && setuid(65534) == 0);
        EXPECT_EQ(0, close(creat((directory + "/foreign.lock").c_str(), 0666)));
    });
    sysroot.WriteFile("/var/tmp/korvane/shared/mutex/left.lock", "");  // ours, from an earlier run
    const std::pair<const char*, bool> names[] = {
        {"left.lock", true},  {"symlink.lock", false},   {"hardlink.lock", false},
        {"fifo.lock", false}, {"directory.lock", false}, {"foreign.lock", false}};
    for (const auto& [name, fileLock] : names) {
        NamedMutex mutex(name);
        EXPECT_EQ(mutex.HasFileLock(), fileLock) << name;
        ScopedNamedLock stillOrdersThreads(mutex);
    }
    EXPECT_EQ(ModeOf(victim), 0600u);
    EXPECT_TRUE(sysroot.Exists("/var/tmp/korvane/shared/mutex/foreign.lock"));
    EXPECT_THROW(NamedMutex mutex("../escape"), vq::dsc::exception::InvalidArgument);
    TempSysroot blocked;
    blocked.WriteFile("/var/tmp/korvane/shared/mutex", "a file where the directory belongs");
    EXPECT_FALSE(NamedMutex("blocked.lock").HasFileLock());
}

// Another user renames the shared directory away and puts a link to a root file in its place,
// again and again, while the mutex directories are created over and over.
TEST(NamedMutexTest, DirectorySwapsOfAnotherUserNeverReachTheirTarget) {
    SharedSysroot sysroot;
    sysroot.MakeDirectory("/var/tmp/korvane/shared");
    // As an earlier installation left it: writable by everyone, without the sticky bit.
    chmod(sysroot.PathOf("/var/tmp/korvane").c_str(), 0777);
    const std::string shared = sysroot.PathOf("/var/tmp/korvane/shared");
    const std::string victim = sysroot.PathOf("/victim");
    const pid_t attacker = StartAsNobody([&] {
        for (int round = 0;; ++round) {
            rename(shared.c_str(), (shared + std::to_string(round)).c_str());
            unlink(shared.c_str());
            symlink(victim.c_str(), shared.c_str());
            unlink(shared.c_str());
            mkdir(shared.c_str(), 0777);
            rename(shared.c_str(), (shared + std::to_string(round)).c_str());
            symlink(victim.c_str(), shared.c_str());
        }
        return 0;
    });
    for (int start = 0; start < 200; ++start) {
        NamedMutex mutex("race" + std::to_string(start) + ".lock");
        ScopedNamedLock lock(mutex);
    }
    kill(attacker, SIGKILL);
    waitpid(attacker, nullptr, 0);
    EXPECT_EQ(ModeOf(victim), 0600u);
    EXPECT_EQ(sysroot.ReadFile("/victim"), "secret");
}

// A lock file left readable by an earlier installation, locked by another user for good: no
// Lock waits beyond the bound, and the mutex goes on without the file lock.
TEST(NamedMutexTest, AFileLockHeldByAnotherUserCostsOneBoundedWait) {
    SharedSysroot sysroot;
    NamedMutex mutex("held.lock");
    const std::string path = mutex.LockFilePath();
    ASSERT_EQ(chmod(path.c_str(), 0666), 0);
    const pid_t holder = StartAsNobody([&path] {
        flock(open(path.c_str(), O_RDONLY), LOCK_EX);
        pause();
        return 0;
    });
    for (int attempt = 0; attempt < 5000 && FileLockIsFree(path); ++attempt) {
        usleep(1000);
    }
    EXPECT_FALSE(FileLockIsFree(path)) << "the holder never took the file lock";
    mutex.Lock();
    mutex.Unlock();
    EXPECT_FALSE(mutex.HasFileLock());
    mutex.Lock();
    mutex.Unlock();
    kill(holder, SIGKILL);
    waitpid(holder, nullptr, 0);
}

}  // namespace

}  // namespace kest::test::trace
