// Reference counting for the plug-in's own shared objects (item handlers, item managers, deferred
// tasks): an atomic count, so references may be taken and dropped on any thread, and
// self-deletion when the last one goes.
#pragma once

#include <atomic>
#include <cstdint>
#include <utility>

#include "com/CountedPtr.h"

namespace vq {
namespace dsc {

// Thread safety: AddRef and Release may be called on any thread at once; the count is atomic.
class RefCountedThreadSafePolicy {
  public:
    RefCountedThreadSafePolicy(const RefCountedThreadSafePolicy&) = delete;
    RefCountedThreadSafePolicy& operator=(const RefCountedThreadSafePolicy&) = delete;

    // Adds a reference; returns the new count.
    uint32_t AddRef() noexcept { return static_cast<uint32_t>(count_.fetch_add(1) + 1); }

    // Drops a reference and deletes the object when none is left; returns the new count.
    uint32_t Release() noexcept {
        const int32_t count = count_.fetch_sub(1) - 1;
        if (count == 0) {
            delete this;
        }
        return static_cast<uint32_t>(count);
    }

    // Adds a reference only while the object is still referenced (count above 0), so an object
    // whose last reference is being dropped is never revived; true when a reference was added.
    bool TryAddRef() noexcept {
        int32_t count = count_.load();
        while (count > 0) {
            if (count_.compare_exchange_weak(count, count + 1)) {
                return true;
            }
        }
        return false;
    }

  protected:
    // A new object starts without references; the first holder adds one.
    RefCountedThreadSafePolicy() = default;
    virtual ~RefCountedThreadSafePolicy() = default;

  private:
    std::atomic<int32_t> count_{0};
};

}  // namespace dsc
}  // namespace vq

// Constructs a counted object and returns the first reference to it. Construction failures
// propagate and leave nothing behind.
template <class T, class... Args>
CountedPtr<T> MakeCounted(Args&&... args) {
    return CountedPtr<T>(new T(std::forward<Args>(args)...));
}
