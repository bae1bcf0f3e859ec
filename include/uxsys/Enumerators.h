// Enumerators over lists the plug-in hands to the host: item names and property tags.
#pragma once

#include <cstdint>

#include "uxsys/IUnknown.h"
#include "uxsys/Types.h"

// fb09815d-7f02-459f-87b8-78227be84126
inline constexpr IID IID_IuxSysEnumStringList = {
    0xfb09815d, 0x7f02, 0x459f, {0x87, 0xb8, 0x78, 0x22, 0x7b, 0xe8, 0x41, 0x26}};
// b21429cd-0ddd-48fa-9ddd-33a1cfa79cde
inline constexpr IID IID_IuxSysEnumPropertyTag = {
    0xb21429cd, 0x0ddd, 0x48fa, {0x9d, 0xdd, 0x33, 0xa1, 0xcf, 0xa7, 0x9c, 0xde}};

// A list of wide strings (item names).
class IuxSysEnumStringList : public IUnknown {
  public:
    // Slot 3: copies up to `count` names into `names` as new host strings the caller frees;
    // `fetched` (may be null when count is 1) receives the number copied. S_FALSE when fewer.
    virtual HRESULT Next(uint32_t count, CvqBStr* names, uint32_t* fetched) = 0;
    // Slot 4: moves past up to `count` names; S_FALSE when the end came first.
    virtual HRESULT Skip(uint32_t count) = 0;
    // Slot 5: goes back to the first name.
    virtual HRESULT Reset() = 0;
    // Slot 6: a new enumerator over the same names at the same position.
    virtual HRESULT Clone(IuxSysEnumStringList** copy) = 0;

  protected:
    ~IuxSysEnumStringList() = default;
};

// A list of property tags in ascending order.
class IuxSysEnumPropertyTag : public IUnknown {
  public:
    // Slot 3: copies up to `count` tags into `tags`; `fetched` (may be null when count is 1)
    // receives the number copied. S_FALSE when fewer.
    virtual HRESULT Next(uint32_t count, uint32_t* tags, uint32_t* fetched) = 0;
    // Slot 4: moves past up to `count` tags; S_FALSE when the end came first.
    virtual HRESULT Skip(uint32_t count) = 0;
    // Slot 5: goes back to the first tag.
    virtual HRESULT Reset() = 0;
    // Slot 6: a new enumerator over the same tags at the same position.
    virtual HRESULT Clone(IuxSysEnumPropertyTag** copy) = 0;

  protected:
    ~IuxSysEnumPropertyTag() = default;
};
