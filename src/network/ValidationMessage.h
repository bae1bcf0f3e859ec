// Handing a validation message to the caller.
#pragma once

#include "uxsys/HostString.h"

// Stores a new host string holding `text` in *slot (the caller frees it), freeing what the slot
// held before; does nothing for a null slot. A string that cannot be allocated leaves null.
inline void StoreValidationMessage(CvqBStr* slot, const wchar_t* text) {
    if (slot == nullptr) {
        return;
    }
    CvqBStrFree(*slot);
    *slot = CvqBStrAlloc(text);
}
