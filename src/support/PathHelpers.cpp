#include "support/PathHelpers.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "support/Exceptions.h"
#include "support/FileDescriptor.h"
#include "support/TextConversion.h"

namespace vq {
namespace dsc {
namespace osdep {
namespace {

// stat, repeated while a signal interrupts it; returns 0 or the error number.
int StatRetryingInterrupts(const std::string& path, struct stat& status) {
    while (stat(path.c_str(), &status) != 0) {
        if (errno != EINTR) {
            return errno;
        }
    }
    return 0;
}

[[noreturn]] void ThrowPathFailure(int errorNumber, const std::string& path) {
    if (errorNumber == EACCES) {
        throw exception::AccessDenied("Access denied: " + path);
    }
    throw PosixError(errorNumber);
}

constexpr int kDirectoryOpenFlags = O_RDONLY | O_DIRECTORY | O_CLOEXEC;
// The read, write and search bits of owner, group and others.
constexpr mode_t kPermissionBits = S_IRWXU | S_IRWXG | S_IRWXO;
// The permission bits with set-user-id, set-group-id and sticky.
constexpr mode_t kModeBits = kPermissionBits | S_ISUID | S_ISGID | S_ISVTX;
constexpr int kCreateAttempts = 8;

int OpenAtRetryingInterrupts(int parent, const std::string& name, int flags) {
    int descriptor;
    do {
        descriptor = openat(parent, name.c_str(), flags);
    } while (descriptor < 0 && errno == EINTR);
    return descriptor;
}

bool OwnedByRootOrUs(const struct stat& status) {
    return status.st_uid == 0 || status.st_uid == geteuid();
}

// Opens the entry `name` of `parent` when it is a symbolic link that only root or this user
// could have placed: the link is theirs and nobody else may write its directory. Otherwise -1,
// with errno ELOOP for another link and `openError` (why the entry did not open) for the rest.
int OpenTrustedLink(int parent, const std::string& name, int openError) {
    struct stat link {};
    struct stat directory {};
    if (fstatat(parent, name.c_str(), &link, AT_SYMLINK_NOFOLLOW) != 0 || !S_ISLNK(link.st_mode)) {
        errno = openError;
        return -1;
    }
    // AT_FDCWD stands for the root directory, whose entries the first level is opened by.
    const int examined = parent == AT_FDCWD ? stat("/", &directory) : fstat(parent, &directory);
    if (!OwnedByRootOrUs(link) || examined != 0 || (directory.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        errno = ELOOP;
        return -1;
    }
    return OpenAtRetryingInterrupts(parent, name, kDirectoryOpenFlags);
}

// Opens the directory `name` below `parent`, creating it with `mode` when it is missing. An
// existing entry must be a directory owned by root or this user; a symbolic link counts only as
// OpenTrustedLink allows. Returns the descriptor or raises the failure.
int OpenOrCreateLevel(int parent, const std::string& name, mode_t mode,
                      const std::string& requestedPath) {
    bool created = false;
    int descriptor = -1;
    // Someone who keeps removing the new directory before it is opened gets a failure, not a
    // loop without end.
    for (int attempt = 0; attempt < kCreateAttempts; ++attempt) {
        descriptor = OpenAtRetryingInterrupts(parent, name, kDirectoryOpenFlags | O_NOFOLLOW);
        // With O_DIRECTORY a link gives ENOTDIR rather than ELOOP.
        if (descriptor < 0 && (errno == ELOOP || errno == ENOTDIR)) {
            descriptor = OpenTrustedLink(parent, name, errno);
        }
        if (descriptor >= 0 || errno != ENOENT) {
            break;
        }
        if (mkdirat(parent, name.c_str(), mode & kPermissionBits) == 0) {
            created = true;
        } else if (errno != EEXIST && errno != EINTR) {
            ThrowPathFailure(errno, requestedPath);
        }
    }
    if (descriptor < 0) {
        ThrowPathFailure(errno, requestedPath);
    }
    kest::FileDescriptor level(descriptor);
    struct stat status {};
    if (fstat(level.Get(), &status) != 0) {
        ThrowPathFailure(errno, requestedPath);
    }
    if (!OwnedByRootOrUs(status)) {
        throw PosixError("Directory belongs to another user: " + requestedPath, EPERM);
    }
    // mkdirat applies the umask and cannot set the sticky bit: the mode is set exactly on the
    // descriptor, never by name, so a swapped entry cannot redirect it.
    if (created && status.st_uid == geteuid() && fchmod(level.Get(), mode) != 0) {
        ThrowPathFailure(errno, requestedPath);
    }
    return level.Release();
}

}  // namespace

bool IsAbsolutePath(const std::string& path) {
    return !path.empty() && path[0] == '/';
}

bool IsAbsolutePath(const std::wstring& path) {
    return !path.empty() && path[0] == L'/';
}

bool IsDirectory(const std::string& path) {
    if (!IsAbsolutePath(path)) {
        return false;
    }
    struct stat status {};
    return StatRetryingInterrupts(path, status) == 0 && S_ISDIR(status.st_mode);
}

bool IsDirectory(const std::wstring& path) {
    return IsDirectory(NarrowFromWide(path));
}

bool IsRegularFile(const std::string& path) {
    if (!IsAbsolutePath(path)) {
        throw exception::InvalidArgument();
    }
    struct stat status {};
    const int errorNumber = StatRetryingInterrupts(path, status);
    if (errorNumber == ENOENT) {
        return false;
    }
    if (errorNumber != 0) {
        throw PosixError(errorNumber);
    }
    return S_ISREG(status.st_mode);
}

bool IsRegularFile(const std::wstring& path) {
    return IsRegularFile(NarrowFromWide(path));
}

void CreateDirectories(const std::string& path, mode_t mode) {
    if (!IsAbsolutePath(path)) {
        throw exception::InvalidArgument();
    }
    // The first level is opened by its absolute name, relative to no descriptor: only root may
    // change the entries of the root directory, and user-mode emulators map a bare "/" to their
    // own library prefix.
    kest::FileDescriptor current;
    std::string::size_type start = 1;
    std::string::size_type lastStart = std::string::npos;
    while (start < path.size()) {
        const std::string::size_type end = std::min(path.find('/', start), path.size());
        if (end > start) {
            const std::string name = path.substr(start, end - start);
            current.Reset(current.Get() < 0 ? OpenOrCreateLevel(AT_FDCWD, "/" + name, mode, path)
                                            : OpenOrCreateLevel(current.Get(), name, mode, path));
            lastStart = start;
        }
        start = end + 1;
    }
    // A shared directory left world-writable without the sticky bit lets anyone remove or
    // rename the entries of others: add the bit when the directory is ours.
    struct stat status {};
    if (lastStart != std::string::npos && (mode & S_ISVTX) != 0 &&
        fstat(current.Get(), &status) == 0 && status.st_uid == geteuid() &&
        (status.st_mode & S_IWOTH) != 0 && (status.st_mode & S_ISVTX) == 0 &&
        fchmod(current.Get(), (status.st_mode & kModeBits) | S_ISVTX) != 0) {
        ThrowPathFailure(errno, path);
    }
}

void CreateDirectories(const std::wstring& path, mode_t mode) {
    CreateDirectories(NarrowFromWide(path), mode);
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
