#include "support/ProcessLockFile.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <utility>

#include "support/Exceptions.h"
#include "support/PathHelpers.h"

namespace vq {
namespace dsc {
namespace osdep {
namespace {

constexpr mode_t kLockFileMode = S_IRUSR | S_IWUSR;
constexpr mode_t kLockDirectoryMode = S_IRWXU | S_IRGRP | S_IXGRP | S_IROTH | S_IXOTH;

bool OwnedByUs(const struct stat& status) {
    return status.st_uid == 0 || status.st_uid == geteuid();
}

// The directory of the lock file, opened; nobody but root or the effective user may change it.
kest::FileDescriptor OpenTrustedDirectory(const std::string& directory) {
    if (!IsDirectory(directory)) {
        CreateDirectories(directory, kLockDirectoryMode);
    }
    kest::FileDescriptor opened(open(directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (opened.Get() < 0) {
        throw PosixError();
    }
    struct stat status {};
    if (fstat(opened.Get(), &status) != 0) {
        throw PosixError();
    }
    if (!OwnedByUs(status) || (status.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        throw PosixError("others may write the lock directory " + directory, EPERM);
    }
    return opened;
}

}  // namespace

ProcessLockFile ProcessLockFile::TryTake(const std::string& path) {
    const std::string::size_type slash = path.rfind('/');
    if (slash == std::string::npos || slash + 1 == path.size()) {
        throw PosixError("not a file path: " + path, EINVAL);
    }
    const kest::FileDescriptor directory =
        OpenTrustedDirectory(slash == 0 ? "/" : path.substr(0, slash));
    kest::FileDescriptor file(
        openat(directory.Get(), path.c_str() + slash + 1,
               O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, kLockFileMode));
    if (file.Get() < 0) {
        throw PosixError();
    }
    struct stat status {};
    if (fstat(file.Get(), &status) != 0) {
        throw PosixError();
    }
    if (!S_ISREG(status.st_mode) || status.st_uid != geteuid()) {
        throw PosixError("not a lock file of ours: " + path, EPERM);
    }
    int locked;
    do {
        locked = flock(file.Get(), LOCK_EX | LOCK_NB);
    } while (locked != 0 && errno == EINTR);
    if (locked != 0) {
        if (errno == EWOULDBLOCK) {
            return ProcessLockFile();
        }
        throw PosixError();
    }
    ProcessLockFile lock(std::move(file));
    lock.RecordHolder(getpid());
    return lock;
}

void ProcessLockFile::RecordHolder(pid_t holder) noexcept {
    if (!descriptor_.IsOpen()) {
        return;
    }
    const std::string text = std::to_string(holder) + "\n";
    // The id is information for people and tools; the flock alone decides who holds the lock.
    if (ftruncate(descriptor_.Get(), 0) == 0) {
        const ssize_t written = pwrite(descriptor_.Get(), text.data(), text.size(), 0);
        static_cast<void>(written);
    }
}

void ProcessLockFile::Release() noexcept {
    descriptor_.Reset();
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
