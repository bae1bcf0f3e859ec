// Owns one reference to an interface the plug-in handed out and releases it on destruction.
#pragma once

#include <utility>

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
    ~InterfaceRef() {
        if (object_ != nullptr) {
            object_->Release();
        }
    }

    T* Get() const { return object_; }
    T* operator->() const { return object_; }

  private:
    T* object_ = nullptr;
};
