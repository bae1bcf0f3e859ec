// The root of every component interface: identity, interface discovery and reference counting.
// Interfaces are abstract classes with virtual operations only (no virtual destructor), so each
// operation's position in the class is its slot in the virtual table.
#pragma once

#include <cstdint>

#include "uxsys/Types.h"

// 00000000-0000-0000-c000-000000000046
inline constexpr IID IID_IUnknown = {
    0x00000000, 0x0000, 0x0000, {0xC0, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x46}};

class IUnknown {
  public:
    // Slot 0: stores the interface `iid` of this object in *object with one new reference and
    // returns S_OK, or stores null and returns E_NOINTERFACE.
    virtual HRESULT QueryInterface(const IID& iid, void** object) = 0;
    // Slot 1: adds a reference; returns the new count.
    virtual uint32_t AddRef() = 0;
    // Slot 2: drops a reference, destroying the object at 0; returns the new count.
    virtual uint32_t Release() = 0;

  protected:
    ~IUnknown() = default;
};
