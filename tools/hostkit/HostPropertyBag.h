// The property bag kestcfg hands to the plug-in as a host does: typed values by tag, the set of
// modified tags, a lock a caller may hold across calls, and copying. It answers all four bag
// interfaces with one pointer.
#pragma once

#include <atomic>
#include <cstdint>
#include <map>
#include <mutex>
#include <set>
#include <vector>

#include "hostkit/InterfaceRef.h"
#include "hostkit/PropertyValue.h"
#include "uxsys/PropertyBag.h"

namespace kest::hostkit {

class HostPropertyBag final : public IuxSysPropertyBag4 {
  public:
    // A new empty bag with one reference for the caller.
    static InterfaceRef<IuxSysPropertyBag4> Create();

    HRESULT QueryInterface(const IID& iid, void** object) override;
    uint32_t AddRef() override;
    uint32_t Release() override;

    HRESULT GetTagEnumerator(IuxSysEnumPropertyTag** tags) override;
    HRESULT HasTag(uint32_t tag) override;
    HRESULT GetTagType(uint32_t tag, uint32_t* type) override;
    HRESULT RemoveTag(uint32_t tag) override;
    HRESULT RemoveAllTags() override;
    HRESULT SetBool(uint32_t tag, int32_t value) override;
    HRESULT SetLong(uint32_t tag, int32_t value) override;
    HRESULT SetULong(uint32_t tag, uint32_t value) override;
    HRESULT SetDouble(uint32_t tag, double value) override;
    HRESULT SetGuid(uint32_t tag, GUID value) override;
    HRESULT SetString(uint32_t tag, const wchar_t* value) override;
    HRESULT Reserved14() override;
    HRESULT GetBool(uint32_t tag, int32_t* value) override;
    HRESULT GetLong(uint32_t tag, int32_t* value) override;
    HRESULT GetULong(uint32_t tag, uint32_t* value) override;
    HRESULT GetDouble(uint32_t tag, double* value) override;
    HRESULT GetGuid(uint32_t tag, GUID* value) override;
    HRESULT GetString(uint32_t tag, CvqBStr* value) override;
    HRESULT GetTimestampFields(uint32_t tag, int32_t fields[6]) override;
    HRESULT Clone(IuxSysPropertyBag** copy) override;

    HRESULT ClearAllModified() override;
    HRESULT GetModifiedTagEnumerator(IuxSysEnumPropertyTag** tags) override;
    HRESULT GetTimestamp(uint32_t tag, uxSysAttrTimestampUTC* value) override;
    HRESULT SetTimestamp(uint32_t tag, uxSysAttrTimestampUTC value) override;

    HRESULT LockBag() override;
    HRESULT UnlockBag() override;

    HRESULT ClearModified(uint32_t tag, int32_t* stillModified) override;
    HRESULT MarkModified(uint32_t tag) override;

  private:
    HostPropertyBag() = default;
    ~HostPropertyBag() = default;

    // Stores `value` under `tag` and marks it modified; a tag holding another type is left as it
    // is (UX_E_PROPERTY_TYPE_MISMATCH).
    HRESULT Set(uint32_t tag, PropertyValue value);
    // Copies the value of `tag` if it is a T; UX_E_PROPERTY_NOT_FOUND or
    // UX_E_PROPERTY_TYPE_MISMATCH otherwise.
    template <class T>
    HRESULT Get(uint32_t tag, T* value);
    // A new enumerator over `tags` (ascending), stored in *result with one reference; S_FALSE
    // (result untouched) when there are none. Throws std::bad_alloc.
    static HRESULT HandOutTags(std::vector<uint32_t> tags, IuxSysEnumPropertyTag** result);

    std::atomic<uint32_t> references_{1};
    std::recursive_mutex mutex_;
    std::map<uint32_t, PropertyValue> values_;
    std::set<uint32_t> modified_;  // every member has a value
    uint32_t callerLocks_ = 0;
};

}  // namespace kest::hostkit
