#include "support/PathHelpers.h"

#include <sys/stat.h>

#include <cerrno>

#include "support/Exceptions.h"
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

// mkdir of one component; an existing entry is left for the caller's final check.
void MakeDirectory(const std::string& directory, mode_t mode, const std::string& requestedPath) {
    while (mkdir(directory.c_str(), mode) != 0) {
        if (errno == EEXIST) {
            return;
        }
        if (errno != EINTR) {
            ThrowPathFailure(errno, requestedPath);
        }
    }
    // mkdir applies the process's umask; chmod gives the directory exactly the requested mode.
    while (chmod(directory.c_str(), mode) != 0) {
        if (errno != EINTR) {
            ThrowPathFailure(errno, requestedPath);
        }
    }
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
    std::string::size_type end = 0;
    while (end != std::string::npos) {
        end = path.find('/', end + 1);
        const std::string directory = path.substr(0, end);
        if (directory.back() != '/') {
            MakeDirectory(directory, mode, path);
        }
    }
    // An existing entry that is no directory (a regular file at the end) is a failure, not a
    // success: the caller asked for a directory there.
    struct stat status {};
    const int errorNumber = StatRetryingInterrupts(path, status);
    if (errorNumber != 0) {
        ThrowPathFailure(errorNumber, path);
    }
    if (!S_ISDIR(status.st_mode)) {
        throw PosixError(ENOTDIR);
    }
}

void CreateDirectories(const std::wstring& path, mode_t mode) {
    CreateDirectories(NarrowFromWide(path), mode);
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
