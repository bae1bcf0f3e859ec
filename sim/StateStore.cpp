#include "StateStore.h"

#include <fcntl.h>
#include <stdlib.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "support/FileDescriptor.h"
#include "support/WholeTransfer.h"

namespace kest::sim {
namespace {

// The state directories and files are readable by everyone, writable by their owner.
constexpr mode_t kDirectoryMode = S_IRWXU | S_IRGRP | S_IXGRP | S_IROTH | S_IXOTH;
constexpr mode_t kFileMode = S_IRUSR | S_IWUSR | S_IRGRP | S_IROTH;

[[noreturn]] void ThrowFailure(const char* operation, const std::string& path, int error) {
    throw StoreFailure(std::string(operation) + " " + path + ": " + std::strerror(error));
}

int OpenRetrying(const std::string& path, int flags, mode_t mode = 0) {
    int fd;
    do {
        fd = ::open(path.c_str(), flags | O_CLOEXEC, mode);
    } while (fd < 0 && errno == EINTR);
    return fd;
}

}  // namespace

std::optional<std::string> CurrentSysroot() {
    const char* value = ::secure_getenv("KEST_SYSROOT");
    if (value == nullptr || value[0] != '/') {
        return std::nullopt;
    }
    std::string sysroot(value);
    while (!sysroot.empty() && sysroot.back() == '/') {
        sysroot.pop_back();
    }
    return sysroot;
}

StateStore::StateStore(const std::string& sysroot) : directory_(sysroot + "/var/lib/vqtargetcfg") {}

void StateStore::EnsureDirectory() const {
    for (size_t slash = directory_.find('/', 1);; slash = directory_.find('/', slash + 1)) {
        const std::string prefix = directory_.substr(0, slash);
        if (::mkdir(prefix.c_str(), kDirectoryMode) != 0 && errno != EEXIST) {
            ThrowFailure("mkdir", prefix, errno);
        }
        if (slash == std::string::npos) {
            break;
        }
    }
    struct stat info;
    if (::stat(directory_.c_str(), &info) != 0) {
        ThrowFailure("stat", directory_, errno);
    }
    if (!S_ISDIR(info.st_mode)) {
        ThrowFailure("mkdir", directory_, ENOTDIR);
    }
}

StateDocument StateStore::Load() const {
    const std::string path = StatePath();
    const kest::FileDescriptor fd(OpenRetrying(path, O_RDONLY));
    if (!fd.IsOpen()) {
        if (errno == ENOENT) {
            return StateDocument();
        }
        ThrowFailure("open", path, errno);
    }
    std::string text;
    if (!kest::ReadToEnd(fd.Get(), text)) {
        ThrowFailure("read", path, errno);
    }
    return StateDocument::Parse(text);
}

void StateStore::Save(const StateDocument& document) const {
    const std::string path = StatePath();
    std::string temporary = path + ".XXXXXX";
    const kest::FileDescriptor fd(::mkostemp(&temporary[0], O_CLOEXEC));
    if (!fd.IsOpen()) {
        ThrowFailure("mkostemp", temporary, errno);
    }
    const std::string text = document.Serialize();
    const bool written = ::fchmod(fd.Get(), kFileMode) == 0 && kest::WriteWhole(fd.Get(), text) &&
                         ::fsync(fd.Get()) == 0 && ::rename(temporary.c_str(), path.c_str()) == 0;
    if (!written) {
        const int error = errno;
        ::unlink(temporary.c_str());
        ThrowFailure("write", path, error);
    }
    const kest::FileDescriptor directory(OpenRetrying(directory_, O_RDONLY | O_DIRECTORY));
    if (!directory.IsOpen() || ::fsync(directory.Get()) != 0) {
        ThrowFailure("fsync", directory_, errno);
    }
}

void StateStore::AppendCallLog(const std::string& line) const {
    const std::string path = CallLogPath();
    const kest::FileDescriptor fd(OpenRetrying(path, O_WRONLY | O_APPEND | O_CREAT, kFileMode));
    if (!fd.IsOpen()) {
        ThrowFailure("open", path, errno);
    }
    if (!kest::WriteWhole(fd.Get(), line)) {
        ThrowFailure("write", path, errno);
    }
}

FileLock::FileLock(const std::string& path) : fd_(OpenRetrying(path, O_RDWR | O_CREAT, kFileMode)) {
    if (!fd_.IsOpen()) {
        ThrowFailure("open", path, errno);
    }
    while (::flock(fd_.Get(), LOCK_EX) != 0) {
        if (errno != EINTR) {
            ThrowFailure("flock", path, errno);
        }
    }
}

}  // namespace kest::sim
