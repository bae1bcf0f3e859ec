#include "hostkit/HostTagEnumerator.h"

#include <new>

#include "uxsys/StatusCodes.h"

namespace kest::hostkit {

InterfaceRef<IuxSysEnumPropertyTag> HostTagEnumerator::Create(std::vector<uint32_t> tags) {
    // The object starts with the one reference handed out here and deletes itself in Release.
    return InterfaceRef<IuxSysEnumPropertyTag>(
        new HostTagEnumerator(std::make_shared<const std::vector<uint32_t>>(std::move(tags)), 0));
}

HostTagEnumerator::HostTagEnumerator(std::shared_ptr<const std::vector<uint32_t>> tags,
                                     size_t position)
    : tags_(std::move(tags)), position_(position) {}

HRESULT HostTagEnumerator::QueryInterface(const IID& iid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (iid == IID_IUnknown || iid == IID_IuxSysEnumPropertyTag) {
        AddRef();
        *object = static_cast<IuxSysEnumPropertyTag*>(this);
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

uint32_t HostTagEnumerator::AddRef() {
    return references_.fetch_add(1, std::memory_order_relaxed) + 1;
}

uint32_t HostTagEnumerator::Release() {
    const uint32_t remaining = references_.fetch_sub(1, std::memory_order_acq_rel) - 1;
    if (remaining == 0) {
        delete this;
    }
    return remaining;
}

HRESULT HostTagEnumerator::Next(uint32_t count, uint32_t* tags, uint32_t* fetched) {
    if (tags == nullptr || (count != 1 && fetched == nullptr)) {
        return E_POINTER;
    }
    uint32_t copied = 0;
    for (; copied < count && position_ < tags_->size(); ++copied, ++position_) {
        tags[copied] = (*tags_)[position_];
    }
    if (fetched != nullptr) {
        *fetched = copied;
    }
    return copied == count ? S_OK : S_FALSE;
}

HRESULT HostTagEnumerator::Skip(uint32_t count) {
    const size_t left = tags_->size() - position_;
    if (count > left) {
        position_ = tags_->size();
        return S_FALSE;
    }
    position_ += count;
    return S_OK;
}

HRESULT HostTagEnumerator::Reset() {
    position_ = 0;
    return S_OK;
}

HRESULT HostTagEnumerator::Clone(IuxSysEnumPropertyTag** copy) {
    if (copy == nullptr) {
        return E_POINTER;
    }
    *copy = new (std::nothrow) HostTagEnumerator(tags_, position_);
    return *copy != nullptr ? S_OK : E_OUTOFMEMORY;
}

}  // namespace kest::hostkit
