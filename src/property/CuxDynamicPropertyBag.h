// The plug-in's property bag: typed values keyed by property tag, the set of modified tags, a lock
// that a caller may hold across several calls, and copying.
// Thread safety: any thread may call any operation at once; each runs under the bag's recursive
// lock, so it is atomic with respect to the others on the same bag.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "com/CVQComMultiThreadModelNoCS.h"
#include "com/CVQComObject.h"
#include "com/CVQComObjectRootEx.h"
#include "com/CountedPtr.h"
#include "property/PropertyValue.h"
#include "support/Mutex.h"
#include "uxsys/PropertyBag.h"

class CuxDynamicPropertyBag : public IuxSysPropertyBag4,
                              public CVQComObjectRootEx<CVQComMultiThreadModelNoCS> {
  public:
    using InterfaceMap = ComInterfaceMap<ComInterface<&IID_IuxSysPropertyBag, IuxSysPropertyBag4>,
                                         ComInterface<&IID_IuxSysPropertyBag2, IuxSysPropertyBag4>,
                                         ComInterface<&IID_IuxSysPropertyBag3, IuxSysPropertyBag4>,
                                         ComInterface<&IID_IuxSysPropertyBag4, IuxSysPropertyBag4>>;

    CuxDynamicPropertyBag() = default;
    // Gives back a caller lock still held by the destroying thread.
    ~CuxDynamicPropertyBag() override;

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
    // One tag's value; `modified` records membership in the modified set, so every modified tag
    // has an entry by construction.
    struct Entry {
        uint32_t tag;
        bool modified;
        std::unique_ptr<CuxPropertyValue> value;
    };
    using Entries = std::vector<Entry>;

    Entries::iterator LowerBound(uint32_t tag);
    Entry* Find(uint32_t tag);
    void MarkEntryModified(Entry& entry);

    template <class T, class Value>
    HRESULT SetTyped(uint32_t tag, Value value);
    template <class T>
    HRESULT FindTyped(uint32_t tag, CuxTemplatePropertyValue<T>** found);
    template <class T>
    HRESULT GetTyped(uint32_t tag, T* value);

    vq::dsc::Mutex lock_;
    // Ascending by unsigned tag, at most one entry per tag.
    Entries entries_;
    uint32_t modifiedCount_ = 0;
    uint32_t callerLockDepth_ = 0;
};

// A new empty bag with one reference. A failed allocation is thrown as the status E_OUTOFMEMORY
// (a long).
CountedPtr<IuxSysPropertyBag4> CreatePropertyBag();
