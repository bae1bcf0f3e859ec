// A lock shared by name between the threads of a process and between processes: a recursive
// mutex per name inside the process, and an exclusive flock on a lock file in the shared lock
// directory ("mutex" under the shared temporary directory) across processes.
//
// The lock directory is writable by everyone, so nothing found there is trusted: the lock file
// is created exclusively, mode 0600, and an existing one is used only when it is a plain file of
// the effective user. When the lock file cannot be used, or another holder keeps it beyond a
// bound, the mutex goes on ordering the threads of this process only: a stranger can neither
// stop nor hang the process through it.
//
// Thread safety: any thread may use a NamedMutex at once; a ScopedNamedLock belongs to the thread
// that made it.
#pragma once

#include <memory>
#include <string>

namespace vq {
namespace dsc {

class NamedLockState;

class NamedMutex {
  public:
    // Opens, creating when needed, the lock file of `name` (its directories 01777). Every
    // NamedMutex of one name in a process shares one lock file descriptor; the lock file is
    // removed when the last of them goes, if this process created it. A name containing '/'
    // raises vq::dsc::exception::InvalidArgument; a lock file that cannot be used leaves the
    // mutex without the file lock (HasFileLock false).
    explicit NamedMutex(const std::string& name);
    ~NamedMutex();
    NamedMutex(const NamedMutex&) = delete;
    NamedMutex& operator=(const NamedMutex&) = delete;

    // Blocks until the calling thread holds the in-process lock; a holder may lock again. The
    // outermost Lock then tries the file lock for a bounded time; when another holder keeps it
    // longer, this mutex does without the file lock from then on.
    void Lock();
    // Undoes one Lock; the outermost one releases the file lock.
    void Unlock();

    // True while the mutex still orders other processes through its lock file.
    bool HasFileLock() const;
    // Where the lock file is.
    const std::string& LockFilePath() const;

  private:
    std::shared_ptr<NamedLockState> state_;
};

// Holds a NamedMutex from construction to the end of the enclosing scope.
class ScopedNamedLock {
  public:
    explicit ScopedNamedLock(NamedMutex& mutex) : mutex_(mutex) { mutex_.Lock(); }
    ~ScopedNamedLock() { mutex_.Unlock(); }
    ScopedNamedLock(const ScopedNamedLock&) = delete;
    ScopedNamedLock& operator=(const ScopedNamedLock&) = delete;

  private:
    NamedMutex& mutex_;
};

}  // namespace dsc
}  // namespace vq
