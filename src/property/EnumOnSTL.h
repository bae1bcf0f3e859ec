// The enumerator components handed to the host: Next, Skip, Reset and Clone over a container that
// is filled before the first enumerator sees it and never changes afterwards. Clones share the
// container and keep it alive through a counted reference to whoever owns it.
// Thread safety: an enumerator's position is not locked, so one enumerator serves one thread at a
// time; its clones have positions of their own and may be used in other threads at once.
#pragma once

#include <cstdint>
#include <utility>

#include "com/CVQComMultiThreadModelNoCS.h"
#include "com/CVQComObject.h"
#include "com/CVQComObjectRootEx.h"
#include "com/CountedPtr.h"
#include "uxsys/HostString.h"
#include "uxsys/IUnknown.h"
#include "uxsys/StatusCodes.h"

// Copies a property tag out of an enumerator; never fails.
struct PropertyTagCopy {
    static bool Copy(uint32_t* to, uint32_t from) noexcept {
        *to = from;
        return true;
    }
    static void Destroy(uint32_t*) noexcept {}
};

// Copies a name out of an enumerator as a new host string; false when it cannot be allocated.
struct HostStringCopy {
    template <class WideString>
    static bool Copy(CvqBStr* to, const WideString& from) noexcept {
        *to = CvqBStrAllocLen(from.data(), from.size());
        return *to != nullptr;
    }
    static void Destroy(CvqBStr* str) noexcept {
        CvqBStrFree(*str);
        *str = nullptr;
    }
};

// The four enumerator operations of `Interface` over a container of elements that `ElementCopy`
// turns into `Element`s for the caller. Holds the owner (a counted reference that keeps the
// container alive, or null when the most derived class owns it), the container and the position.
template <class Interface, const IID* Iid, class Element, class Container, class ElementCopy>
class IVQEnumOnSTLImpl : public Interface {
  public:
    // Copies up to `count` elements from the position on into `out`, advancing past each;
    // `fetched` (may be null only when count is 1) receives the number copied. S_OK when all
    // `count` were copied, S_FALSE when the end came first. When an element cannot be copied,
    // the elements copied by this call are destroyed, the position goes back to where the call
    // started, *fetched becomes 0 and the result is E_OUTOFMEMORY.
    HRESULT Next(uint32_t count, Element* out, uint32_t* fetched) override {
        if (out == nullptr || (count != 1 && fetched == nullptr)) {
            return E_POINTER;
        }
        const Iterator start = position_;
        uint32_t copied = 0;
        while (copied < count && position_ != container_->end()) {
            if (!ElementCopy::Copy(&out[copied], *position_)) {
                while (copied > 0) {
                    ElementCopy::Destroy(&out[--copied]);
                }
                position_ = start;
                if (fetched != nullptr) {
                    *fetched = 0;
                }
                return E_OUTOFMEMORY;
            }
            ++copied;
            ++position_;
        }
        if (fetched != nullptr) {
            *fetched = copied;
        }
        return copied == count ? S_OK : S_FALSE;
    }

    // Moves past up to `count` elements; S_OK when all were skipped, S_FALSE at the end first.
    HRESULT Skip(uint32_t count) override {
        for (uint32_t skipped = 0; skipped < count; ++skipped) {
            if (position_ == container_->end()) {
                return S_FALSE;
            }
            ++position_;
        }
        return S_OK;
    }

    // Goes back to the first element.
    HRESULT Reset() override {
        position_ = container_->begin();
        return S_OK;
    }

    // A new enumerator over the same container at the same position, with its own position.
    // It keeps the container alive through this enumerator's owner, or through this enumerator
    // when it owns the container itself.
    HRESULT Clone(Interface** copy) override;

  protected:
    using Iterator = typename Container::const_iterator;

    IVQEnumOnSTLImpl(CountedPtr<IUnknown> owner, const Container* container, Iterator position)
        : owner_(std::move(owner)), container_(container), position_(position) {}

    const CountedPtr<IUnknown> owner_;
    const Container* const container_;
    Iterator position_;
};

// An enumerator component over a container that someone else owns (the owner reference).
template <class Interface, const IID* Iid, class Element, class Container, class ElementCopy>
class CVQComEnumOnSTL : public IVQEnumOnSTLImpl<Interface, Iid, Element, Container, ElementCopy>,
                        public CVQComObjectRootEx<CVQComMultiThreadModelNoCS> {
    using Impl = IVQEnumOnSTLImpl<Interface, Iid, Element, Container, ElementCopy>;

  public:
    using InterfaceMap = ComInterfaceMap<ComInterface<Iid, Interface>>;

    // Enumerates `container` from `position`, keeping it alive through `owner` (null when the
    // derived class owns the container).
    CVQComEnumOnSTL(CountedPtr<IUnknown> owner, const Container* container,
                    typename Impl::Iterator position)
        : Impl(std::move(owner), container, position) {}
};

template <class Interface, const IID* Iid, class Element, class Container, class ElementCopy>
HRESULT IVQEnumOnSTLImpl<Interface, Iid, Element, Container, ElementCopy>::Clone(Interface** copy) {
    if (copy == nullptr) {
        return E_POINTER;
    }
    *copy = nullptr;
    using CloneClass = CVQComEnumOnSTL<Interface, Iid, Element, Container, ElementCopy>;
    CountedPtr<IUnknown> owner =
        owner_ ? owner_ : CountedPtr<IUnknown>(static_cast<Interface*>(this));
    CVQComObject<CloneClass>* created = nullptr;
    const HRESULT status =
        CreateComObjectInstance<CloneClass>(&created, std::move(owner), container_, position_);
    if (FAILED(status)) {
        return status;
    }
    const CountedPtr<CVQComObject<CloneClass>> clone(created);
    return clone->QueryInterface(*Iid, reinterpret_cast<void**>(copy));
}
