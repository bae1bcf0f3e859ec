// The runtime library's recursive mutex, with priority inheritance where the platform offers it,
// and the scoped guard that holds it for a block.
// Thread safety: a Mutex is made to be shared by threads; a ScopedLock belongs to the thread that
// made it.
#pragma once

#include <pthread.h>

#include <atomic>
#include <cstdint>

namespace vq {
namespace dsc {

// A recursive mutex that records its owner thread and how often that owner has locked it.
class Mutex {
  public:
    // Creates the mutex; raises vq::dsc::osdep::PosixError when the platform refuses.
    Mutex();
    ~Mutex();
    Mutex(const Mutex&) = delete;
    Mutex& operator=(const Mutex&) = delete;

    // Blocks until the calling thread owns the mutex; an owner may lock again.
    void Lock();
    // Undoes one Lock; raises vq::dsc::exception::InvalidOperation when the caller is no owner.
    void Unlock();
    // Locks without blocking; true when the calling thread now owns the mutex.
    bool TryLock();

    // True when the calling thread owns the mutex.
    bool IsOwnedByCurrentThread() const;
    // How many times the owner has locked the mutex (0 when it is free).
    uint32_t RecursionCount() const { return recursionCount_.load(std::memory_order_relaxed); }

  private:
    void RecordAcquired();

    pthread_mutex_t mutex_;
    std::atomic<pthread_t> owner_{};
    std::atomic<uint32_t> recursionCount_{0};
};

// Holds a Mutex from construction to the end of the enclosing scope.
class ScopedLock {
  public:
    explicit ScopedLock(Mutex& mutex) : mutex_(mutex) { mutex_.Lock(); }
    // Unlock raises only for a thread that does not own the mutex; this one locked it.
    ~ScopedLock() { mutex_.Unlock(); }  // NOLINT(bugprone-exception-escape)
    ScopedLock(const ScopedLock&) = delete;
    ScopedLock& operator=(const ScopedLock&) = delete;

  private:
    Mutex& mutex_;
};

}  // namespace dsc
}  // namespace vq
