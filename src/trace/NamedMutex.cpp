#include "trace/NamedMutex.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <map>
#include <mutex>

#include "support/Exceptions.h"
#include "support/FileDescriptor.h"
#include "support/Mutex.h"
#include "support/PathHelpers.h"
#include "support/Sleep.h"
#include "support/Sysroot.h"

namespace vq {
namespace dsc {
namespace {

constexpr mode_t kLockDirectoryMode = S_IRWXU | S_IRWXG | S_IRWXO | S_ISVTX;
constexpr mode_t kLockFileMode = S_IRUSR | S_IWUSR;
// The file lock is tried this often, kFileLockRetryMs apart, before the mutex gives it up.
constexpr int kFileLockAttempts = 200;
constexpr uint32_t kFileLockRetryMs = 5;

int OpenRetryingInterrupts(const std::string& path, int flags, mode_t mode = 0) {
    int descriptor;
    do {
        descriptor = open(path.c_str(), flags, mode);
    } while (descriptor < 0 && errno == EINTR);
    return descriptor;
}

// A lock file this process may use: nothing, or the open file with `created` telling whether
// this call created it.
kest::FileDescriptor OpenLockFile(const std::string& path, bool& created) {
    constexpr int kFlags = O_RDWR | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;
    created = false;
    kest::FileDescriptor file(
        OpenRetryingInterrupts(path, kFlags | O_CREAT | O_EXCL, kLockFileMode));
    if (file.IsOpen()) {
        created = true;
        return file;
    }
    if (errno != EEXIST) {
        return file;
    }
    // Someone else's file, a link or anything but a plain file could let them hold the lock
    // for ever or make this process lock a file of their choosing.
    file.Reset(OpenRetryingInterrupts(path, kFlags));
    struct stat status {};
    if (file.IsOpen() && (fstat(file.Get(), &status) != 0 || !S_ISREG(status.st_mode) ||
                          status.st_nlink != 1 || status.st_uid != geteuid())) {
        file.Reset();
    }
    return file;
}

}  // namespace

// The per-process state of one name: the mutex that orders the process's threads and the lock
// file descriptor, reopened in a child process because a descriptor inherited through fork
// shares its file lock with the parent.
class NamedLockState {
  public:
    // Without `directoryTrusted` no lock file is opened at all.
    NamedLockState(std::string lockFilePath, bool directoryTrusted)
        : path(std::move(lockFilePath)), openedBy_(getpid()) {
        if (directoryTrusted) {
            descriptor_ = OpenLockFile(path, created_);
        }
        usable_.store(descriptor_.IsOpen());
    }
    ~NamedLockState() { CloseLockFile(); }
    NamedLockState(const NamedLockState&) = delete;
    NamedLockState& operator=(const NamedLockState&) = delete;

    // The lock file descriptor of this process, reopened first after a fork (the mutex must be
    // held); -1 without a usable lock file.
    int DescriptorOfThisProcess() {
        if (openedBy_ != getpid()) {
            CloseLockFile();  // the parent's file: closed, never removed here
            descriptor_ = OpenLockFile(path, created_);
            openedBy_ = getpid();
        }
        return descriptor_.Get();
    }

    // Takes the file lock within the bound; false (and no file lock from then on) otherwise.
    bool LockFile() {
        const int descriptor = DescriptorOfThisProcess();
        for (int attempt = 0; descriptor >= 0 && attempt < kFileLockAttempts; ++attempt) {
            if (flock(descriptor, LOCK_EX | LOCK_NB) == 0) {
                fileLocked_ = true;
                return true;
            }
            if (errno != EWOULDBLOCK && errno != EINTR) {
                break;
            }
            osdep::SleepMs(kFileLockRetryMs);
        }
        GiveUpFileLock();
        return false;
    }

    void UnlockFile() {
        if (fileLocked_) {
            flock(descriptor_.Get(), LOCK_UN);
            fileLocked_ = false;
        }
    }

    bool HasFileLock() const { return usable_.load(); }

    const std::string path;
    Mutex mutex;

  private:
    void GiveUpFileLock() {
        usable_.store(false);
        CloseLockFile();
    }

    // Closes the lock file, removing it when this very process created it and the name still
    // is that file.
    void CloseLockFile() {
        if (!descriptor_.IsOpen()) {
            return;
        }
        struct stat named {};
        struct stat held {};
        if (created_ && openedBy_ == getpid() && lstat(path.c_str(), &named) == 0 &&
            fstat(descriptor_.Get(), &held) == 0 && named.st_dev == held.st_dev &&
            named.st_ino == held.st_ino) {
            unlink(path.c_str());
        }
        descriptor_.Reset();
    }

    kest::FileDescriptor descriptor_;
    bool created_ = false;
    bool fileLocked_ = false;
    std::atomic<bool> usable_{true};
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
            const std::string directory = kest::paths::NamedMutexDirectory();
            bool directoryTrusted = true;
            try {
                osdep::CreateDirectories(directory, kLockDirectoryMode);
            } catch (const exception::Exception&) {
                directoryTrusted = false;  // the state goes on without a lock file
            }
            state = std::make_shared<NamedLockState>(directory + "/" + name, directoryTrusted);
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
    if (state_->mutex.RecursionCount() == 1 && state_->HasFileLock()) {
        state_->LockFile();
    }
}

void NamedMutex::Unlock() {
    if (state_->mutex.RecursionCount() == 1) {
        state_->UnlockFile();
    }
    state_->mutex.Unlock();
}

bool NamedMutex::HasFileLock() const {
    return state_->HasFileLock();
}

const std::string& NamedMutex::LockFilePath() const {
    return state_->path;
}

}  // namespace dsc
}  // namespace vq
