#include "trace/NamedMutex.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <map>
#include <mutex>

#include "support/Exceptions.h"
#include "support/Mutex.h"
#include "support/PathHelpers.h"
#include "support/Sleep.h"
#include "support/Sysroot.h"

namespace vq {
namespace dsc {
namespace {

constexpr mode_t kLockDirectoryMode = 0777;
constexpr mode_t kLockFileMode = 0666;
constexpr int kOpenAttempts = 3;

// Opens the lock file without following a symbolic link and accepts only a regular file with
// one link: the directory is writable by everyone, so anything else may have been planted to
// make this process lock, or change the mode of, a file of someone else's choosing.
int OpenLockFile(const std::string& path) {
    int descriptor = -1;
    for (int attempt = 1;;) {
        descriptor = open(path.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC,
                          kLockFileMode);
        if (descriptor >= 0) {
            break;
        }
        if (errno == EINTR) {
            continue;
        }
        if (errno != EACCES || attempt == kOpenAttempts) {
            throw osdep::PosixError();
        }
        ++attempt;
        osdep::SleepMs(1);
    }
    struct stat status;
    if (fstat(descriptor, &status) != 0 || !S_ISREG(status.st_mode) || status.st_nlink != 1) {
        close(descriptor);
        throw osdep::PosixError("Lock file is not a regular file with one link: " + path, EPERM);
    }
    if (fchmod(descriptor, kLockFileMode) != 0 && errno != EPERM && errno != EACCES) {
        int error = errno;
        close(descriptor);
        throw osdep::PosixError(error);
    }
    return descriptor;
}

}  // namespace

// The per-process state of one name: the mutex that orders the process's threads and the lock
// file descriptor, reopened in a child process because a descriptor inherited through fork
// shares its file lock with the parent.
class NamedLockState {
  public:
    explicit NamedLockState(std::string lockFilePath)
        : path(std::move(lockFilePath)), descriptor_(OpenLockFile(path)), openedBy_(getpid()) {}
    ~NamedLockState() { close(descriptor_); }
    NamedLockState(const NamedLockState&) = delete;
    NamedLockState& operator=(const NamedLockState&) = delete;

    // The lock file descriptor of this process, reopened first after a fork (the mutex must be
    // held).
    int DescriptorOfThisProcess() {
        if (openedBy_ != getpid()) {
            int reopened = OpenLockFile(path);
            close(descriptor_);
            descriptor_ = reopened;
            openedBy_ = getpid();
        }
        return descriptor_;
    }

    // The descriptor the outermost Lock of this process locked.
    int LockedDescriptor() const { return descriptor_; }

    const std::string path;
    Mutex mutex;

  private:
    int descriptor_;
    pid_t openedBy_;
};

namespace {

// One state per name while any NamedMutex of that name exists.
class NamedLockRegistry {
  public:
    std::shared_ptr<NamedLockState> Obtain(const std::string& name) {
        std::lock_guard<std::mutex> guard(mutex_);
        std::shared_ptr<NamedLockState> state = states_[name].lock();
        if (!state) {
            std::string directory = kest::paths::NamedMutexDirectory();
            osdep::CreateDirectories(directory, kLockDirectoryMode);
            state = std::make_shared<NamedLockState>(directory + "/" + name);
            states_[name] = state;
        }
        return state;
    }

  private:
    std::mutex mutex_;
    std::map<std::string, std::weak_ptr<NamedLockState>> states_;
};

NamedLockRegistry& Registry() {
    static NamedLockRegistry registry;
    return registry;
}

}  // namespace

NamedMutex::NamedMutex(const std::string& name) {
    if (name.empty() || name.find('/') != std::string::npos || name == "." || name == "..") {
        throw exception::InvalidArgument();
    }
    state_ = Registry().Obtain(name);
}

NamedMutex::~NamedMutex() = default;

void NamedMutex::Lock() {
    state_->mutex.Lock();
    if (state_->mutex.RecursionCount() > 1) {
        return;
    }
    try {
        int descriptor = state_->DescriptorOfThisProcess();
        while (flock(descriptor, LOCK_EX) != 0) {
            if (errno != EINTR) {
                throw osdep::PosixError();
            }
        }
    } catch (...) {
        state_->mutex.Unlock();
        throw;
    }
}

void NamedMutex::Unlock() {
    if (state_->mutex.RecursionCount() == 1) {
        flock(state_->LockedDescriptor(), LOCK_UN);
    }
    state_->mutex.Unlock();
}

const std::string& NamedMutex::LockFilePath() const {
    return state_->path;
}

}  // namespace dsc
}  // namespace vq
