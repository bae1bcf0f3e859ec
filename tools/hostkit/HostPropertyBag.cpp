#include "hostkit/HostPropertyBag.h"

#include <time.h>

#include <new>
#include <vector>

#include "hostkit/HostTagEnumerator.h"
#include "hostkit/TimestampText.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::hostkit {

using Lock = std::lock_guard<std::recursive_mutex>;

InterfaceRef<IuxSysPropertyBag4> HostPropertyBag::Create() {
    // The object starts with the one reference handed out here and deletes itself in Release.
    return InterfaceRef<IuxSysPropertyBag4>(new HostPropertyBag());
}

HRESULT HostPropertyBag::QueryInterface(const IID& iid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (iid == IID_IUnknown || iid == IID_IuxSysPropertyBag || iid == IID_IuxSysPropertyBag2 ||
        iid == IID_IuxSysPropertyBag3 || iid == IID_IuxSysPropertyBag4) {
        AddRef();
        *object = static_cast<IuxSysPropertyBag4*>(this);
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

uint32_t HostPropertyBag::AddRef() {
    return references_.fetch_add(1, std::memory_order_relaxed) + 1;
}

uint32_t HostPropertyBag::Release() {
    const uint32_t remaining = references_.fetch_sub(1, std::memory_order_acq_rel) - 1;
    if (remaining == 0) {
        delete this;
    }
    return remaining;
}

HRESULT HostPropertyBag::HandOutTags(std::vector<uint32_t> tags, IuxSysEnumPropertyTag** result) {
    if (tags.empty()) {
        return S_FALSE;
    }
    InterfaceRef<IuxSysEnumPropertyTag> enumerator = HostTagEnumerator::Create(std::move(tags));
    *result = enumerator.Get();
    (*result)->AddRef();
    return S_OK;
}

HRESULT HostPropertyBag::GetTagEnumerator(IuxSysEnumPropertyTag** tags) {
    if (tags == nullptr) {
        return E_POINTER;
    }
    try {
        const Lock lock(mutex_);
        std::vector<uint32_t> all;
        all.reserve(values_.size());
        for (const auto& entry : values_) {
            all.push_back(entry.first);
        }
        return HandOutTags(std::move(all), tags);
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT HostPropertyBag::HasTag(uint32_t tag) {
    const Lock lock(mutex_);
    return values_.count(tag) != 0 ? S_OK : S_FALSE;
}

HRESULT HostPropertyBag::GetTagType(uint32_t tag, uint32_t* type) {
    if (type == nullptr) {
        return E_POINTER;
    }
    const Lock lock(mutex_);
    const auto found = values_.find(tag);
    if (found == values_.end()) {
        return UX_E_PROPERTY_NOT_FOUND;
    }
    *type = TypeCodeOf(found->second);
    return S_OK;
}

HRESULT HostPropertyBag::RemoveTag(uint32_t tag) {
    const Lock lock(mutex_);
    if (values_.erase(tag) == 0) {
        return UX_E_PROPERTY_NOT_FOUND;
    }
    modified_.erase(tag);
    return S_OK;
}

HRESULT HostPropertyBag::RemoveAllTags() {
    const Lock lock(mutex_);
    values_.clear();
    modified_.clear();
    return S_OK;
}

HRESULT HostPropertyBag::Set(uint32_t tag, PropertyValue value) {
    try {
        const Lock lock(mutex_);
        const auto found = values_.find(tag);
        if (found != values_.end()) {
            if (found->second.index() != value.index()) {
                return UX_E_PROPERTY_TYPE_MISMATCH;
            }
            modified_.insert(tag);
            found->second = std::move(value);
            return S_OK;
        }
        const auto inserted = values_.emplace(tag, std::move(value)).first;
        try {
            modified_.insert(tag);
        } catch (...) {
            values_.erase(inserted);
            throw;
        }
        return S_OK;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT HostPropertyBag::SetBool(uint32_t tag, int32_t value) {
    return Set(tag, PropertyValue(std::in_place_type<bool>, value != 0));
}

HRESULT HostPropertyBag::SetLong(uint32_t tag, int32_t value) {
    return Set(tag, PropertyValue(std::in_place_type<int32_t>, value));
}

HRESULT HostPropertyBag::SetULong(uint32_t tag, uint32_t value) {
    return Set(tag, PropertyValue(std::in_place_type<uint32_t>, value));
}

HRESULT HostPropertyBag::SetDouble(uint32_t tag, double value) {
    return Set(tag, PropertyValue(std::in_place_type<double>, value));
}

HRESULT HostPropertyBag::SetGuid(uint32_t tag, GUID value) {
    return Set(tag, PropertyValue(std::in_place_type<GUID>, value));
}

HRESULT HostPropertyBag::SetString(uint32_t tag, const wchar_t* value) {
    if (value == nullptr) {
        return E_POINTER;
    }
    try {
        return Set(tag, PropertyValue(std::in_place_type<std::wstring>, value));
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT HostPropertyBag::SetTimestamp(uint32_t tag, uxSysAttrTimestampUTC value) {
    return Set(tag, PropertyValue(std::in_place_type<uxSysAttrTimestampUTC>, value));
}

HRESULT HostPropertyBag::Reserved14() {
    return E_NOTIMPL;
}

template <class T>
HRESULT HostPropertyBag::Get(uint32_t tag, T* value) {
    const Lock lock(mutex_);
    const auto found = values_.find(tag);
    if (found == values_.end()) {
        return UX_E_PROPERTY_NOT_FOUND;
    }
    const T* stored = std::get_if<T>(&found->second);
    if (stored == nullptr) {
        return UX_E_PROPERTY_TYPE_MISMATCH;
    }
    *value = *stored;
    return S_OK;
}

HRESULT HostPropertyBag::GetBool(uint32_t tag, int32_t* value) {
    if (value == nullptr) {
        return E_POINTER;
    }
    bool flag = false;
    const HRESULT status = Get(tag, &flag);
    *value = flag ? 1 : 0;
    return status;
}

HRESULT HostPropertyBag::GetLong(uint32_t tag, int32_t* value) {
    return value == nullptr ? E_POINTER : Get(tag, value);
}

HRESULT HostPropertyBag::GetULong(uint32_t tag, uint32_t* value) {
    return value == nullptr ? E_POINTER : Get(tag, value);
}

HRESULT HostPropertyBag::GetDouble(uint32_t tag, double* value) {
    return value == nullptr ? E_POINTER : Get(tag, value);
}

HRESULT HostPropertyBag::GetGuid(uint32_t tag, GUID* value) {
    return value == nullptr ? E_POINTER : Get(tag, value);
}

HRESULT HostPropertyBag::GetString(uint32_t tag, CvqBStr* value) {
    if (value == nullptr) {
        return E_POINTER;
    }
    *value = nullptr;
    const Lock lock(mutex_);
    const auto found = values_.find(tag);
    if (found == values_.end()) {
        return UX_E_PROPERTY_NOT_FOUND;
    }
    const std::wstring* text = std::get_if<std::wstring>(&found->second);
    if (text == nullptr) {
        return UX_E_PROPERTY_TYPE_MISMATCH;
    }
    *value = CvqBStrAllocLen(text->data(), text->size());
    return *value != nullptr ? S_OK : E_OUTOFMEMORY;
}

HRESULT HostPropertyBag::GetTimestamp(uint32_t tag, uxSysAttrTimestampUTC* value) {
    return value == nullptr ? E_POINTER : Get(tag, value);
}

HRESULT HostPropertyBag::GetTimestampFields(uint32_t tag, int32_t fields[6]) {
    if (fields == nullptr) {
        return E_POINTER;
    }
    for (int i = 0; i < 6; ++i) {
        fields[i] = -1;
    }
    uxSysAttrTimestampUTC time{};
    const HRESULT status = Get(tag, &time);
    if (status < 0 || IsNoTime(time) || time.seconds < INT64_MIN + kSecondsFrom1904To1970) {
        return status;
    }
    const time_t posixSeconds = static_cast<time_t>(time.seconds - kSecondsFrom1904To1970);
    struct tm local {};
    // A time that time_t cannot hold (past January 2038 where it has 32 bits) has no fields.
    if (static_cast<int64_t>(posixSeconds) != time.seconds - kSecondsFrom1904To1970 ||
        localtime_r(&posixSeconds, &local) == nullptr) {
        return status;
    }
    const int32_t values[6] = {local.tm_year + 1900, local.tm_mon + 1, local.tm_mday,
                               local.tm_hour,        local.tm_min,     local.tm_sec};
    for (int i = 0; i < 6; ++i) {
        fields[i] = values[i];
    }
    return S_OK;
}

HRESULT HostPropertyBag::Clone(IuxSysPropertyBag** copy) {
    if (copy == nullptr) {
        return E_POINTER;
    }
    *copy = nullptr;
    HostPropertyBag* clone = new (std::nothrow) HostPropertyBag();
    if (clone == nullptr) {
        return E_OUTOFMEMORY;
    }
    InterfaceRef<IuxSysPropertyBag4> owner(clone);
    try {
        const Lock lock(mutex_);
        clone->values_ = values_;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
    *copy = clone;
    clone->AddRef();
    return S_OK;
}

HRESULT HostPropertyBag::ClearAllModified() {
    const Lock lock(mutex_);
    if (modified_.empty()) {
        return S_FALSE;
    }
    modified_.clear();
    return S_OK;
}

HRESULT HostPropertyBag::GetModifiedTagEnumerator(IuxSysEnumPropertyTag** tags) {
    if (tags == nullptr) {
        return E_POINTER;
    }
    *tags = nullptr;
    try {
        const Lock lock(mutex_);
        return HandOutTags(std::vector<uint32_t>(modified_.begin(), modified_.end()), tags);
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

HRESULT HostPropertyBag::LockBag() {
    mutex_.lock();
    ++callerLocks_;
    return S_OK;
}

HRESULT HostPropertyBag::UnlockBag() {
    const Lock lock(mutex_);
    if (callerLocks_ == 0) {
        return E_FAIL;
    }
    --callerLocks_;
    mutex_.unlock();
    return S_OK;
}

HRESULT HostPropertyBag::ClearModified(uint32_t tag, int32_t* stillModified) {
    const Lock lock(mutex_);
    HRESULT status = S_OK;
    if (values_.count(tag) == 0) {
        status = UX_E_PROPERTY_NOT_FOUND;
    } else if (modified_.erase(tag) == 0) {
        status = S_FALSE;
    }
    if (stillModified != nullptr) {
        *stillModified = modified_.empty() ? 0 : 1;
    }
    return status;
}

HRESULT HostPropertyBag::MarkModified(uint32_t tag) {
    try {
        const Lock lock(mutex_);
        if (values_.count(tag) == 0) {
            return UX_E_PROPERTY_NOT_FOUND;
        }
        modified_.insert(tag);
        return S_OK;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

}  // namespace kest::hostkit
