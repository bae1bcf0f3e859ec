// CVQComObject<T> completes a component class T: it supplies QueryInterface (from T's interface
// map), AddRef and Release for every interface subobject of T, and deleting destruction.
//
// T derives from its interfaces and from CVQComObjectRootEx<CVQComMultiThreadModelNoCS> (a
// virtual base when T has several interface bases) and declares `using InterfaceMap = ...;`.
//
// Thread safety: QueryInterface, AddRef and Release may be called from any thread at once; T's
// own operations state their own rules.
#pragma once

#include <cstdint>
#include <utility>

#include "com/CountedPtr.h"
#include "com/InterfaceMap.h"
#include "uxsys/StatusCodes.h"
#include "uxsys/Types.h"

template <class T>
class CVQComObject final : public T {
  public:
    // A new object with a reference count of 0.
    template <class... Args>
    explicit CVQComObject(Args&&... args) : T(std::forward<Args>(args)...) {}

    // Stores the interface `iid` with one new reference, or null and E_NOINTERFACE.
    // E_POINTER for a null result pointer.
    HRESULT QueryInterface(const IID& iid, void** object) override {
        if (object == nullptr) {
            return E_POINTER;
        }
        static const auto map = BuildInterfaceMap(this, typename T::InterfaceMap{});
        *object = FindInterfaceInMap(this, map.data(), iid);
        if (*object == nullptr) {
            return E_NOINTERFACE;
        }
        AddRef();
        return S_OK;
    }

    // Adds a reference; returns the new count.
    uint32_t AddRef() override { return static_cast<uint32_t>(this->InternalAddRef()); }

    // Drops a reference and destroys the object when the count reaches 0; returns the new count.
    // A Release without a reference left returns 0 and destroys nothing.
    uint32_t Release() override {
        const int32_t count = this->InternalRelease();
        if (count == 0) {
            this->PrepareForDestruction();
            delete this;
        }
        return count > 0 ? static_cast<uint32_t>(count) : 0;
    }

  private:
    ~CVQComObject() override = default;
};

// Creates a CVQComObject<T> with a reference count of 0 in *object. A failed allocation or
// construction gives E_OUTOFMEMORY and a null *object.
template <class T, class... Args>
HRESULT CreateComObjectInstance(CVQComObject<T>** object, Args&&... args) noexcept {
    *object = nullptr;
    try {
        *object = new CVQComObject<T>(std::forward<Args>(args)...);
        return S_OK;
    } catch (...) {
        return E_OUTOFMEMORY;
    }
}

// Creates a CVQComObject<T> and returns it holding one reference. A failed allocation or
// construction is thrown as the status E_OUTOFMEMORY (a long).
template <class T, class... Args>
CountedPtr<CVQComObject<T>> CreateCountedComObject(Args&&... args) {
    CVQComObject<T>* object = nullptr;
    const HRESULT status = CreateComObjectInstance<T>(&object, std::forward<Args>(args)...);
    if (FAILED(status)) {
        throw static_cast<long>(status);
    }
    return CountedPtr<CVQComObject<T>>(object);
}
