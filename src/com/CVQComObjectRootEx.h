// The reference count of a component object. A class with several interface bases derives from
// it virtually, so the object has exactly one count however many interfaces it implements.
// Thread safety: the count changes only through ThreadModel, which serialises the changes.
#pragma once

#include <cstdint>

#include "com/CVQComObjectRootBase.h"

template <class ThreadModel>
class CVQComObjectRootEx : public CVQComObjectRootBase {
  protected:
    CVQComObjectRootEx() = default;

    // Adds a reference; returns the new count.
    int32_t InternalAddRef() { return ThreadModel::Increment(&refCount_); }
    // Drops a reference; returns the new count (0: the caller destroys the object).
    int32_t InternalRelease() { return ThreadModel::Decrement(&refCount_); }
    // Called once the count reached 0 and before destruction: sets the count to 1, so an
    // AddRef/Release pair made during destruction cannot start a second destruction.
    void PrepareForDestruction() { refCount_ = 1; }

  private:
    int32_t refCount_ = 0;
};
