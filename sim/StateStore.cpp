#include "StateStore.h"

#include <fcntl.h>
#include <stdlib.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace vqsim {
namespace {

// The state directories and files are readable by everyone, writable by their owner.
constexpr mode_t kDirectoryMode = S_IRWXU | S_IRGRP | S_IXGRP | S_IROTH | S_IXOTH;
constexpr mode_t kFileMode = S_IRUSR | S_IWUSR | S_IRGRP | S_IROTH;

[[noreturn]] void ThrowFailure(const char* operation, const std::string& path, int error) {
    throw StoreFailure(std::string(operation) + " " + path + ": " + std::strerror(error));
}

// Closes a descriptor on scope exit.
class FdCloser {
  public:
    explicit FdCloser(int fd) : fd_(fd) {}
    ~FdCloser() {
        if (fd_ >= 0) {
            ::close(fd_);
        }
    }
    FdCloser(const FdCloser&) = delete;
    FdCloser& operator=(const FdCloser&) = delete;
    int Get() const { return fd_; }

  private:
    int fd_;
};

// Writes all of `size` bytes, repeating after short writes and EINTR.
bool WriteAll(int fd, const char* data, size_t size) {
    while (size > 0) {
        const ssize_t written = ::write(fd, data, size);
        if (written < 0) {
            if (errno == EINTR) {
                continue;
            }
            return false;
        }
        data += written;
        size -= static_cast<size_t>(written);
    }
    return true;
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
    const FdCloser fd(OpenRetrying(path, O_RDONLY));
    if (fd.Get() < 0) {
        if (errno == ENOENT) {
            return StateDocument();
        }
        ThrowFailure("open", path, errno);
    }
    std::string text;
    char buffer[4096];
    for (;;) {
        const ssize_t count = ::read(fd.Get(), buffer, sizeof buffer);
        if (count < 0) {
            if (errno == EINTR) {
                continue;
            }
            ThrowFailure("read", path, errno);
        }
        if (count == 0) {
            break;
        }
        text.append(buffer, static_cast<size_t>(count));
    }
    return StateDocument::Parse(text);
}

void StateStore::Save(const StateDocument& document) const {
    const std::string path = StatePath();
    std::string temporary = path + ".XXXXXX";
    const FdCloser fd(::mkostemp(&temporary[0], O_CLOEXEC));
    if (fd.Get() < 0) {
        ThrowFailure("mkostemp", temporary, errno);
    }
    const std::string text = document.Serialize();
    const bool written = ::fchmod(fd.Get(), kFileMode) == 0 &&
                         WriteAll(fd.Get(), text.data(), text.size()) && ::fsync(fd.Get()) == 0 &&
                         ::rename(temporary.c_str(), path.c_str()) == 0;
    if (!written) {
        const int error = errno;
        ::unlink(temporary.c_str());
        ThrowFailure("write", path, error);
    }
    const FdCloser directory(OpenRetrying(directory_, O_RDONLY | O_DIRECTORY));
    if (directory.Get() < 0 || ::fsync(directory.Get()) != 0) {
        ThrowFailure("fsync", directory_, errno);
    }
}

void StateStore::AppendCallLog(const std::string& line) const {
    const std::string path = CallLogPath();
    const FdCloser fd(OpenRetrying(path, O_WRONLY | O_APPEND | O_CREAT, kFileMode));
    if (fd.Get() < 0) {
        ThrowFailure("open", path, errno);
    }
    if (!WriteAll(fd.Get(), line.data(), line.size())) {
        ThrowFailure("write", path, errno);
    }
}

FileLock::FileLock(const std::string& path) : fd_(OpenRetrying(path, O_RDWR | O_CREAT, kFileMode)) {
    if (fd_ < 0) {
        ThrowFailure("open", path, errno);
    }
    while (::flock(fd_, LOCK_EX) != 0) {
        if (errno != EINTR) {
            const int error = errno;
            ::close(fd_);
            ThrowFailure("flock", path, error);
        }
    }
}

FileLock::~FileLock() {
    ::close(fd_);
}

}  // namespace vqsim
