// A lock shared by name between the threads of a process and between processes: a recursive
// mutex per name inside the process, and an exclusive flock on a lock file in the shared lock
// directory ("mutex" under the shared temporary directory) across processes.
#pragma once

#include <memory>
#include <string>

namespace vq {
namespace dsc {

class NamedLockState;

class NamedMutex {
  public:
    // Opens, creating when needed, the lock file of `name` (mode 0666, its directories 0777).
    // Every NamedMutex of one name in a process shares one lock file descriptor. Raises
    // vq::dsc::osdep::PosixError (or AccessDenied for a directory it may not create) when the
    // lock file cannot be used, including when the name is taken by anything but a regular file
    // with a single link; a name containing '/' raises vq::dsc::exception::InvalidArgument.
    explicit NamedMutex(const std::string& name);
    ~NamedMutex();
    NamedMutex(const NamedMutex&) = delete;
    NamedMutex& operator=(const NamedMutex&) = delete;

    // Blocks until the calling thread holds the lock; a holder may lock again. Only the
    // outermost Lock takes the file lock. A failing flock releases the mutex and raises
    // vq::dsc::osdep::PosixError.
    void Lock();
    // Undoes one Lock; the outermost one releases the file lock.
    void Unlock();

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
