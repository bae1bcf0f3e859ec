#include "support/Mutex.h"

#include <unistd.h>

#include <cerrno>

#include "support/Exceptions.h"

namespace vq {
namespace dsc {
namespace {

// Owns a mutex attribute object for the duration of the mutex's initialisation.
class MutexAttributes {
  public:
    MutexAttributes() {
        const int result = pthread_mutexattr_init(&attributes_);
        if (result != 0) {
            throw osdep::PosixError(result);
        }
    }
    ~MutexAttributes() { pthread_mutexattr_destroy(&attributes_); }
    MutexAttributes(const MutexAttributes&) = delete;
    MutexAttributes& operator=(const MutexAttributes&) = delete;

    pthread_mutexattr_t* Get() { return &attributes_; }

  private:
    pthread_mutexattr_t attributes_;
};

}  // namespace

Mutex::Mutex() {
    MutexAttributes attributes;
    int result = pthread_mutexattr_settype(attributes.Get(), PTHREAD_MUTEX_RECURSIVE);
    if (result != 0) {
        throw osdep::PosixError(result);
    }
#if defined(_POSIX_THREAD_PRIO_INHERIT) && _POSIX_THREAD_PRIO_INHERIT > 0
    // Priority inheritance is a refinement: a platform that refuses it still gets a mutex.
    pthread_mutexattr_setprotocol(attributes.Get(), PTHREAD_PRIO_INHERIT);
#endif
    result = pthread_mutex_init(&mutex_, attributes.Get());
    if (result != 0) {
        throw osdep::PosixError(result);
    }
}

Mutex::~Mutex() {
    pthread_mutex_destroy(&mutex_);
}

void Mutex::Lock() {
    const int result = pthread_mutex_lock(&mutex_);
    if (result != 0) {
        throw osdep::PosixError(result);
    }
    RecordAcquired();
}

bool Mutex::TryLock() {
    const int result = pthread_mutex_trylock(&mutex_);
    if (result == EBUSY) {
        return false;
    }
    if (result != 0) {
        throw osdep::PosixError(result);
    }
    RecordAcquired();
    return true;
}

void Mutex::Unlock() {
    if (!IsOwnedByCurrentThread()) {
        throw exception::InvalidOperation();
    }
    // Only the owner writes these fields, so relaxed accesses suffice: another thread can never
    // see its own identity in owner_ unless it stored it there itself.
    const uint32_t remaining = recursionCount_.load(std::memory_order_relaxed) - 1;
    recursionCount_.store(remaining, std::memory_order_relaxed);
    if (remaining == 0) {
        owner_.store(pthread_t{}, std::memory_order_relaxed);
    }
    pthread_mutex_unlock(&mutex_);
}

bool Mutex::IsOwnedByCurrentThread() const {
    return recursionCount_.load(std::memory_order_relaxed) > 0 &&
           pthread_equal(owner_.load(std::memory_order_relaxed), pthread_self()) != 0;
}

void Mutex::RecordAcquired() {
    owner_.store(pthread_self(), std::memory_order_relaxed);
    recursionCount_.store(recursionCount_.load(std::memory_order_relaxed) + 1,
                          std::memory_order_relaxed);
}

}  // namespace dsc
}  // namespace vq
