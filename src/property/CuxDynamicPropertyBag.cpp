#include "property/CuxDynamicPropertyBag.h"

#include <algorithm>
#include <ctime>
#include <limits>
#include <utility>

#include "property/PropertyTagEnumerator.h"
#include "support/EntryGuard.h"
#include "uxsys/StatusCodes.h"

using namespace kest::property;

namespace {

// Seconds from 1904-01-01 00:00:00 UTC to the POSIX epoch.
constexpr int64_t kSecondsFrom1904To1970 = 2082844800;

// Writes year, month (1 to 12), day, hour, minute and second of `seconds1904` in the process's
// local time zone. False, with nothing written, when the time cannot be represented.
bool LocalTimeFields(int64_t seconds1904, int32_t fields[6]) {
    int64_t posixSeconds = 0;
    if (__builtin_sub_overflow(seconds1904, kSecondsFrom1904To1970, &posixSeconds)) {
        return false;
    }
    time_t posixTime = 0;
    if (__builtin_add_overflow(posixSeconds, 0, &posixTime)) {
        return false;
    }
    std::tm calendar{};
    if (localtime_r(&posixTime, &calendar) == nullptr) {
        return false;
    }
    const int64_t year = static_cast<int64_t>(calendar.tm_year) + 1900;
    if (year > std::numeric_limits<int32_t>::max()) {
        return false;
    }
    fields[0] = static_cast<int32_t>(year);
    fields[1] = calendar.tm_mon + 1;
    fields[2] = calendar.tm_mday;
    fields[3] = calendar.tm_hour;
    fields[4] = calendar.tm_min;
    fields[5] = calendar.tm_sec;
    return true;
}

bool IsNoTime(const uxSysAttrTimestampUTC& time) {
    return time.fraction == 0 && time.seconds == 0;
}

}  // namespace

CuxDynamicPropertyBag::~CuxDynamicPropertyBag() {
    while (callerLockDepth_ > 0 && lock_.IsOwnedByCurrentThread()) {
        lock_.Unlock();
        --callerLockDepth_;
    }
}

CuxDynamicPropertyBag::Entries::iterator CuxDynamicPropertyBag::LowerBound(uint32_t tag) {
    return std::lower_bound(entries_.begin(), entries_.end(), tag,
                            [](const Entry& entry, uint32_t key) { return entry.tag < key; });
}

CuxDynamicPropertyBag::Entry* CuxDynamicPropertyBag::Find(uint32_t tag) {
    const auto it = LowerBound(tag);
    return it != entries_.end() && it->tag == tag ? &*it : nullptr;
}

void CuxDynamicPropertyBag::MarkEntryModified(Entry& entry) {
    if (!entry.modified) {
        entry.modified = true;
        ++modifiedCount_;
    }
}

template <class T, class Value>
HRESULT CuxDynamicPropertyBag::SetTyped(uint32_t tag, Value value) {
    const auto it = LowerBound(tag);
    Entry* entry = nullptr;
    if (it != entries_.end() && it->tag == tag) {
        CuxTemplatePropertyValue<T>* typed = PropertyValueAs<T>(it->value.get());
        if (typed == nullptr) {
            return UX_E_PROPERTY_TYPE_MISMATCH;
        }
        typed->SetValue(std::move(value));
        entry = &*it;
    } else {
        auto created = std::make_unique<CuxTemplatePropertyValue<T>>(std::move(value));
        entry = &*entries_.insert(it, Entry{tag, false, std::move(created)});
    }
    MarkEntryModified(*entry);
    return S_OK;
}

template <class T>
HRESULT CuxDynamicPropertyBag::FindTyped(uint32_t tag, CuxTemplatePropertyValue<T>** found) {
    Entry* entry = Find(tag);
    if (entry == nullptr) {
        return UX_E_PROPERTY_NOT_FOUND;
    }
    *found = PropertyValueAs<T>(entry->value.get());
    return *found != nullptr ? S_OK : UX_E_PROPERTY_TYPE_MISMATCH;
}

template <class T>
HRESULT CuxDynamicPropertyBag::GetTyped(uint32_t tag, T* value) {
    if (value == nullptr) {
        return E_POINTER;
    }
    return GuardEntryPoint("CuxDynamicPropertyBag::Get() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        CuxTemplatePropertyValue<T>* found = nullptr;
        const HRESULT status = FindTyped<T>(tag, &found);
        if (status == S_OK) {
            *value = found->Value();
        }
        return status;
    });
}

HRESULT CuxDynamicPropertyBag::GetTagEnumerator(IuxSysEnumPropertyTag** tags) {
    if (tags == nullptr) {
        return E_POINTER;
    }
    *tags = nullptr;
    return GuardEntryPoint("CuxDynamicPropertyBag::GetTagEnumerator() failed", [&] {
        PropertyTagList snapshot;
        {
            vq::dsc::ScopedLock hold(lock_);
            if (entries_.empty()) {
                return S_FALSE;
            }
            snapshot.reserve(entries_.size());
            for (const Entry& entry : entries_) {
                snapshot.push_back(entry.tag);
            }
        }
        *tags = CreatePropertyTagEnumerator(std::move(snapshot)).Detach();
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::HasTag(uint32_t tag) {
    return GuardEntryPoint("CuxDynamicPropertyBag::HasTag() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        return Find(tag) != nullptr ? S_OK : S_FALSE;
    });
}

HRESULT CuxDynamicPropertyBag::GetTagType(uint32_t tag, uint32_t* type) {
    if (type == nullptr) {
        return E_POINTER;
    }
    return GuardEntryPoint("CuxDynamicPropertyBag::GetTagType() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        const Entry* entry = Find(tag);
        if (entry == nullptr) {
            return UX_E_PROPERTY_NOT_FOUND;
        }
        *type = entry->value->TypeCode();
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::RemoveTag(uint32_t tag) {
    return GuardEntryPoint("CuxDynamicPropertyBag::RemoveTag() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        const auto it = LowerBound(tag);
        if (it == entries_.end() || it->tag != tag) {
            return UX_E_PROPERTY_NOT_FOUND;
        }
        if (it->modified) {
            --modifiedCount_;
        }
        entries_.erase(it);
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::RemoveAllTags() {
    return GuardEntryPoint("CuxDynamicPropertyBag::RemoveAllTags() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        entries_.clear();
        modifiedCount_ = 0;
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::SetBool(uint32_t tag, int32_t value) {
    return GuardEntryPoint("CuxDynamicPropertyBag::SetBool() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        return SetTyped<bool>(tag, value != 0);
    });
}

HRESULT CuxDynamicPropertyBag::SetLong(uint32_t tag, int32_t value) {
    return GuardEntryPoint("CuxDynamicPropertyBag::SetLong() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        return SetTyped<int32_t>(tag, value);
    });
}

HRESULT CuxDynamicPropertyBag::SetULong(uint32_t tag, uint32_t value) {
    return GuardEntryPoint("CuxDynamicPropertyBag::SetULong() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        return SetTyped<uint32_t>(tag, value);
    });
}

HRESULT CuxDynamicPropertyBag::SetDouble(uint32_t tag, double value) {
    return GuardEntryPoint("CuxDynamicPropertyBag::SetDouble() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        return SetTyped<double>(tag, value);
    });
}

HRESULT CuxDynamicPropertyBag::SetGuid(uint32_t tag, GUID value) {
    return GuardEntryPoint("CuxDynamicPropertyBag::SetGuid() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        return SetTyped<GUID>(tag, value);
    });
}

HRESULT CuxDynamicPropertyBag::SetString(uint32_t tag, const wchar_t* value) {
    if (value == nullptr) {
        return E_POINTER;
    }
    return GuardEntryPoint("CuxDynamicPropertyBag::SetString() failed", [&] {
        CvqBStrHolder copy(CvqBStrAlloc(value));
        if (copy.Get() == nullptr) {
            return E_OUTOFMEMORY;
        }
        vq::dsc::ScopedLock hold(lock_);
        return SetTyped<CvqBStr>(tag, std::move(copy));
    });
}

HRESULT CuxDynamicPropertyBag::SetTimestamp(uint32_t tag, uxSysAttrTimestampUTC value) {
    return GuardEntryPoint("CuxDynamicPropertyBag::SetTimestamp() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        return SetTyped<uxSysAttrTimestampUTC>(tag, value);
    });
}

HRESULT CuxDynamicPropertyBag::Reserved14() {
    return E_NOTIMPL;
}

HRESULT CuxDynamicPropertyBag::GetBool(uint32_t tag, int32_t* value) {
    if (value == nullptr) {
        return E_POINTER;
    }
    *value = 0;
    bool stored = false;
    const HRESULT status = GetTyped<bool>(tag, &stored);
    *value = stored ? 1 : 0;
    return status;
}

HRESULT CuxDynamicPropertyBag::GetLong(uint32_t tag, int32_t* value) {
    return GetTyped<int32_t>(tag, value);
}

HRESULT CuxDynamicPropertyBag::GetULong(uint32_t tag, uint32_t* value) {
    return GetTyped<uint32_t>(tag, value);
}

HRESULT CuxDynamicPropertyBag::GetDouble(uint32_t tag, double* value) {
    return GetTyped<double>(tag, value);
}

HRESULT CuxDynamicPropertyBag::GetGuid(uint32_t tag, GUID* value) {
    return GetTyped<GUID>(tag, value);
}

HRESULT CuxDynamicPropertyBag::GetTimestamp(uint32_t tag, uxSysAttrTimestampUTC* value) {
    return GetTyped<uxSysAttrTimestampUTC>(tag, value);
}

HRESULT CuxDynamicPropertyBag::GetString(uint32_t tag, CvqBStr* value) {
    if (value == nullptr) {
        return E_POINTER;
    }
    *value = nullptr;
    return GuardEntryPoint("CuxDynamicPropertyBag::GetString() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        CuxTemplatePropertyValue<CvqBStr>* found = nullptr;
        const HRESULT status = FindTyped<CvqBStr>(tag, &found);
        if (status != S_OK) {
            return status;
        }
        *value = CopyHostString(found->Value()).Release();
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::GetTimestampFields(uint32_t tag, int32_t fields[6]) {
    if (fields == nullptr) {
        return E_POINTER;
    }
    std::fill(fields, fields + 6, -1);
    uxSysAttrTimestampUTC time{};
    const HRESULT status = GetTimestamp(tag, &time);
    if (status != S_OK || IsNoTime(time)) {
        return status;
    }
    int32_t converted[6];
    if (LocalTimeFields(time.seconds, converted)) {
        std::copy(converted, converted + 6, fields);
    }
    return S_OK;
}

HRESULT CuxDynamicPropertyBag::Clone(IuxSysPropertyBag** copy) {
    if (copy == nullptr) {
        return E_POINTER;
    }
    *copy = nullptr;
    return GuardEntryPoint("CuxDynamicPropertyBag::Clone() failed", [&] {
        CountedPtr<CVQComObject<CuxDynamicPropertyBag>> clone =
            CreateCountedComObject<CuxDynamicPropertyBag>();
        {
            vq::dsc::ScopedLock hold(lock_);
            clone->entries_.reserve(entries_.size());
            for (const Entry& entry : entries_) {
                clone->entries_.push_back(Entry{entry.tag, false, entry.value->Copy()});
            }
        }
        *copy = clone.Detach();
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::ClearAllModified() {
    return GuardEntryPoint("CuxDynamicPropertyBag::ClearAllModified() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        if (modifiedCount_ == 0) {
            return S_FALSE;
        }
        for (Entry& entry : entries_) {
            entry.modified = false;
        }
        modifiedCount_ = 0;
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::GetModifiedTagEnumerator(IuxSysEnumPropertyTag** tags) {
    if (tags == nullptr) {
        return E_POINTER;
    }
    *tags = nullptr;
    return GuardEntryPoint("CuxDynamicPropertyBag::GetModifiedTagEnumerator() failed", [&] {
        PropertyTagList snapshot;
        {
            vq::dsc::ScopedLock hold(lock_);
            if (modifiedCount_ == 0) {
                return S_FALSE;
            }
            snapshot.reserve(modifiedCount_);
            for (const Entry& entry : entries_) {
                if (entry.modified) {
                    snapshot.push_back(entry.tag);
                }
            }
        }
        *tags = CreatePropertyTagEnumerator(std::move(snapshot)).Detach();
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::LockBag() {
    return GuardEntryPoint("CuxDynamicPropertyBag::LockBag() failed", [&] {
        lock_.Lock();
        ++callerLockDepth_;
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::UnlockBag() {
    return GuardEntryPoint("CuxDynamicPropertyBag::UnlockBag() failed", [&] {
        // Taking the lock first means only the thread holding the caller lock gets past here
        // while the depth is above 0.
        vq::dsc::ScopedLock hold(lock_);
        if (callerLockDepth_ == 0) {
            return E_FAIL;
        }
        --callerLockDepth_;
        lock_.Unlock();
        return S_OK;
    });
}

HRESULT CuxDynamicPropertyBag::ClearModified(uint32_t tag, int32_t* stillModified) {
    return GuardEntryPoint("CuxDynamicPropertyBag::ClearModified() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        Entry* entry = Find(tag);
        HRESULT status = S_OK;
        if (entry == nullptr) {
            status = UX_E_PROPERTY_NOT_FOUND;
        } else if (!entry->modified) {
            status = S_FALSE;
        } else {
            entry->modified = false;
            --modifiedCount_;
        }
        if (stillModified != nullptr) {
            *stillModified = modifiedCount_ > 0 ? 1 : 0;
        }
        return status;
    });
}

HRESULT CuxDynamicPropertyBag::MarkModified(uint32_t tag) {
    return GuardEntryPoint("CuxDynamicPropertyBag::MarkModified() failed", [&] {
        vq::dsc::ScopedLock hold(lock_);
        Entry* entry = Find(tag);
        if (entry == nullptr) {
            return UX_E_PROPERTY_NOT_FOUND;
        }
        MarkEntryModified(*entry);
        return S_OK;
    });
}

CountedPtr<IuxSysPropertyBag4> CreatePropertyBag() {
    return CreateCountedComObject<CuxDynamicPropertyBag>();
}
