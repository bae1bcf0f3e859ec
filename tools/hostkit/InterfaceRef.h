// Owns one reference to a component interface and releases it on destruction.
#pragma once

#include <utility>

#include "uxsys/IUnknown.h"

namespace kest::hostkit {

template <class T>
class InterfaceRef {
  public:
    InterfaceRef() = default;
    // Takes over a reference the caller already holds.
    explicit InterfaceRef(T* object) : object_(object) {}
    InterfaceRef(InterfaceRef&& other) noexcept : object_(std::exchange(other.object_, nullptr)) {}
    InterfaceRef& operator=(InterfaceRef&& other) noexcept {
        std::swap(object_, other.object_);
        return *this;
    }
    InterfaceRef(const InterfaceRef&) = delete;
    InterfaceRef& operator=(const InterfaceRef&) = delete;
    ~InterfaceRef() { Reset(); }

    T* Get() const { return object_; }
    T* operator->() const { return object_; }
    explicit operator bool() const { return object_ != nullptr; }

    // Releases the held reference (if any) and returns the address for an operation to store a
    // new one in.
    T** Receive() {
        Reset();
        return &object_;
    }

    // Releases the held reference, if any.
    void Reset() {
        if (object_ != nullptr) {
            std::exchange(object_, nullptr)->Release();
        }
    }

    // Hands the held reference to the caller, who releases it, and leaves this empty.
    [[nodiscard]] T* Detach() { return std::exchange(object_, nullptr); }

  private:
    T* object_ = nullptr;
};

// Asks `object` for the interface `iid` of type T; empty when it does not offer it.
template <class T>
InterfaceRef<T> QueryInterfaceAs(IUnknown* object, const IID& iid) {
    InterfaceRef<T> result;
    void* pointer = nullptr;
    if (object != nullptr && object->QueryInterface(iid, &pointer) >= 0 && pointer != nullptr) {
        *result.Receive() = static_cast<T*>(pointer);
    }
    return result;
}

}  // namespace kest::hostkit
