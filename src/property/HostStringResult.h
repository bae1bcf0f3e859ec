// Handing a text to the caller as a new host string, in a result pointer or a message slot.
#pragma once

#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::property {

// Stores a new host string holding `text` in *result (the caller frees it). E_POINTER for a null
// result; E_OUTOFMEMORY, with null stored, when the string cannot be allocated.
inline HRESULT StoreNewHostString(const wchar_t* text, CvqBStr* result) noexcept {
    if (result == nullptr) {
        return E_POINTER;
    }
    *result = CvqBStrAlloc(text);
    return *result == nullptr ? E_OUTOFMEMORY : S_OK;
}

// Stores a new host string holding `text` in *slot (the caller frees it), freeing what the slot
// held before; does nothing for a null slot. A string that cannot be allocated leaves null.
inline void StoreValidationMessage(CvqBStr* slot, const wchar_t* text) {
    if (slot == nullptr) {
        return;
    }
    CvqBStrFree(*slot);
    StoreNewHostString(text, slot);
}

}  // namespace kest::property
