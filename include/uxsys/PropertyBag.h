// Property bags: typed values keyed by 32-bit property tags, with a set of modified tags, a lock
// a caller can hold across several calls, and copying. Every bag identifier yields the same
// interface pointer, so IuxSysPropertyBag4 offers all operations.
#pragma once

#include <cstdint>

#include "uxsys/Enumerators.h"
#include "uxsys/IUnknown.h"
#include "uxsys/Types.h"

// 3e2f201d-cabe-466f-93ae-502244c18dde
inline constexpr IID IID_IuxSysPropertyBag = {
    0x3e2f201d, 0xcabe, 0x466f, {0x93, 0xae, 0x50, 0x22, 0x44, 0xc1, 0x8d, 0xde}};
// e275e061-297b-4463-a5f1-5d2d9d8f3898
inline constexpr IID IID_IuxSysPropertyBag2 = {
    0xe275e061, 0x297b, 0x4463, {0xa5, 0xf1, 0x5d, 0x2d, 0x9d, 0x8f, 0x38, 0x98}};
// b122aab9-2f03-4e75-a0d1-a0f7c7df2838
inline constexpr IID IID_IuxSysPropertyBag3 = {
    0xb122aab9, 0x2f03, 0x4e75, {0xa0, 0xd1, 0xa0, 0xf7, 0xc7, 0xdf, 0x28, 0x38}};
// 9f3973b1-2dad-4ed7-98e5-df0bda39414c
inline constexpr IID IID_IuxSysPropertyBag4 = {
    0x9f3973b1, 0x2dad, 0x4ed7, {0x98, 0xe5, 0xdf, 0x0b, 0xda, 0x39, 0x41, 0x4c}};

// Type codes of property values, as GetTagType reports them.
constexpr uint32_t UX_PROPERTY_TYPE_BOOL = 1;
constexpr uint32_t UX_PROPERTY_TYPE_LONG = 2;
constexpr uint32_t UX_PROPERTY_TYPE_ULONG = 3;
constexpr uint32_t UX_PROPERTY_TYPE_DOUBLE = 4;
constexpr uint32_t UX_PROPERTY_TYPE_GUID = 5;
constexpr uint32_t UX_PROPERTY_TYPE_STRING = 6;
constexpr uint32_t UX_PROPERTY_TYPE_TIMESTAMP = 7;

// Setters store the value and mark the tag modified; a tag holding another type gives
// UX_E_PROPERTY_TYPE_MISMATCH. Getters give UX_E_PROPERTY_NOT_FOUND for an absent tag and
// UX_E_PROPERTY_TYPE_MISMATCH for a value of another type.
class IuxSysPropertyBag : public IUnknown {
  public:
    // Slot 3: an enumerator over a snapshot of all tags; S_FALSE and a null result when empty.
    virtual HRESULT GetTagEnumerator(IuxSysEnumPropertyTag** tags) = 0;
    // Slot 4: S_OK when the tag is present, S_FALSE when not.
    virtual HRESULT HasTag(uint32_t tag) = 0;
    // Slot 5: the type code (UX_PROPERTY_TYPE_*) of the tag's value.
    virtual HRESULT GetTagType(uint32_t tag, uint32_t* type) = 0;
    // Slot 6: removes the tag's value and its modified mark.
    virtual HRESULT RemoveTag(uint32_t tag) = 0;
    // Slot 7: removes every value and every modified mark.
    virtual HRESULT RemoveAllTags() = 0;
    // Slot 8: stores a boolean (nonzero is true).
    virtual HRESULT SetBool(uint32_t tag, int32_t value) = 0;
    // Slot 9: stores a signed 32-bit integer.
    virtual HRESULT SetLong(uint32_t tag, int32_t value) = 0;
    // Slot 10: stores an unsigned 32-bit integer.
    virtual HRESULT SetULong(uint32_t tag, uint32_t value) = 0;
    // Slot 11: stores a double.
    virtual HRESULT SetDouble(uint32_t tag, double value) = 0;
    // Slot 12: stores a GUID.
    virtual HRESULT SetGuid(uint32_t tag, GUID value) = 0;
    // Slot 13: stores a copy of a zero-terminated wide string (null gives E_POINTER).
    virtual HRESULT SetString(uint32_t tag, const wchar_t* value) = 0;
    // Slot 14: not supported; returns E_NOTIMPL.
    virtual HRESULT Reserved14() = 0;
    // Slot 15: reads a boolean as 1 or 0; always writes *value (0 on failure).
    virtual HRESULT GetBool(uint32_t tag, int32_t* value) = 0;
    // Slot 16: reads a signed 32-bit integer.
    virtual HRESULT GetLong(uint32_t tag, int32_t* value) = 0;
    // Slot 17: reads an unsigned 32-bit integer.
    virtual HRESULT GetULong(uint32_t tag, uint32_t* value) = 0;
    // Slot 18: reads a double.
    virtual HRESULT GetDouble(uint32_t tag, double* value) = 0;
    // Slot 19: reads a GUID.
    virtual HRESULT GetGuid(uint32_t tag, GUID* value) = 0;
    // Slot 20: reads a new host string the caller frees; always writes *value (null on failure).
    virtual HRESULT GetString(uint32_t tag, CvqBStr* value) = 0;
    // Slot 21: a timestamp as local year, month, day, hour, minute, second; -1 in each field
    // when the tag is missing or holds no time.
    virtual HRESULT GetTimestampFields(uint32_t tag, int32_t fields[6]) = 0;
    // Slot 22: a new bag with the same values and no modified tags.
    virtual HRESULT Clone(IuxSysPropertyBag** copy) = 0;

  protected:
    ~IuxSysPropertyBag() = default;
};

class IuxSysPropertyBag2 : public IuxSysPropertyBag {
  public:
    // Slot 23: empties the modified set; S_FALSE when it was empty already.
    virtual HRESULT ClearAllModified() = 0;
    // Slot 24: an enumerator over a snapshot of the modified tags; S_FALSE (null) when none.
    virtual HRESULT GetModifiedTagEnumerator(IuxSysEnumPropertyTag** tags) = 0;
    // Slot 25: reads a timestamp.
    virtual HRESULT GetTimestamp(uint32_t tag, uxSysAttrTimestampUTC* value) = 0;
    // Slot 26: stores a timestamp.
    virtual HRESULT SetTimestamp(uint32_t tag, uxSysAttrTimestampUTC value) = 0;

  protected:
    ~IuxSysPropertyBag2() = default;
};

class IuxSysPropertyBag3 : public IuxSysPropertyBag2 {
  public:
    // Slot 27: takes the bag's lock and keeps it after returning (recursive per thread).
    virtual HRESULT LockBag() = 0;
    // Slot 28: releases one LockBag; E_FAIL when the bag is not locked.
    virtual HRESULT UnlockBag() = 0;

  protected:
    ~IuxSysPropertyBag3() = default;
};

class IuxSysPropertyBag4 : public IuxSysPropertyBag3 {
  public:
    // Slot 29: removes the tag from the modified set (S_FALSE when it was not there);
    // *stillModified (may be null) receives 1 while other tags remain modified, else 0.
    virtual HRESULT ClearModified(uint32_t tag, int32_t* stillModified) = 0;
    // Slot 30: adds a present tag to the modified set.
    virtual HRESULT MarkModified(uint32_t tag) = 0;

  protected:
    ~IuxSysPropertyBag4() = default;
};
