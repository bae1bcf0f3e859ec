// The one owning pointer for every counted reference: component interface pointers and the
// plug-in's own counted objects alike (anything with AddRef() and Release()).
// Thread safety: one CountedPtr belongs to one thread at a time; CountedPtrs to the same object
// may be copied and dropped in different threads at once when the object's count is thread-safe.
#pragma once

#include <cstddef>
#include <utility>

#include "uxsys/Types.h"

// Tag: the pointer takes over a reference the caller already holds.
struct AdoptReference {};
inline constexpr AdoptReference kAdoptReference{};

template <class T>
class CountedPtr {
  public:
    CountedPtr() noexcept = default;
    CountedPtr(std::nullptr_t) noexcept {}
    // Shares `object`: adds a reference of its own (nothing for null).
    explicit CountedPtr(T* object) noexcept : object_(object) { AddRefHeld(); }
    // Takes over the caller's reference to `object` without adding one.
    CountedPtr(T* object, AdoptReference) noexcept : object_(object) {}

    CountedPtr(const CountedPtr& other) noexcept : CountedPtr(other.object_) {}
    CountedPtr(CountedPtr&& other) noexcept : object_(other.Detach()) {}
    template <class U>
    CountedPtr(const CountedPtr<U>& other) noexcept : CountedPtr(other.Get()) {}
    template <class U>
    CountedPtr(CountedPtr<U>&& other) noexcept : object_(other.Detach()) {}

    ~CountedPtr() { Reset(); }

    CountedPtr& operator=(CountedPtr other) noexcept {
        std::swap(object_, other.object_);
        return *this;
    }

    // The held pointer; the reference stays here.
    T* Get() const noexcept { return object_; }
    T* operator->() const noexcept { return object_; }
    T& operator*() const noexcept { return *object_; }
    explicit operator bool() const noexcept { return object_ != nullptr; }

    // Gives the held reference to the caller and becomes null.
    T* Detach() noexcept {
        T* object = object_;
        object_ = nullptr;
        return object;
    }

    // Drops the held reference (if any) and becomes null.
    void Reset() noexcept {
        T* object = Detach();
        if (object != nullptr) {
            object->Release();
        }
    }

    // Drops the held reference and returns the address of the (now null) pointer, for a call
    // that stores a new reference there.
    T** Receive() noexcept {
        Reset();
        return &object_;
    }

    // As Receive(), typed for QueryInterface.
    void** ReceiveVoid() noexcept { return reinterpret_cast<void**>(Receive()); }

  private:
    void AddRefHeld() noexcept {
        if (object_ != nullptr) {
            object_->AddRef();
        }
    }

    T* object_ = nullptr;
};

template <class T, class U>
bool operator==(const CountedPtr<T>& a, const CountedPtr<U>& b) noexcept {
    return a.Get() == b.Get();
}
template <class T, class U>
bool operator!=(const CountedPtr<T>& a, const CountedPtr<U>& b) noexcept {
    return a.Get() != b.Get();
}
template <class T>
bool operator==(const CountedPtr<T>& a, std::nullptr_t) noexcept {
    return a.Get() == nullptr;
}
template <class T>
bool operator!=(const CountedPtr<T>& a, std::nullptr_t) noexcept {
    return a.Get() != nullptr;
}

// Asks `object` for interface `iid` and returns it (null when the object does not answer it).
template <class Interface, class T>
CountedPtr<Interface> QueryCounted(const CountedPtr<T>& object, const IID& iid) noexcept {
    CountedPtr<Interface> result;
    if (object) {
        object->QueryInterface(iid, result.ReceiveVoid());
    }
    return result;
}
