// Storing a fixed text as a new host string in a caller's result pointer.
#pragma once

#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

// Stores a new host string holding `text` in *result (the caller frees it). E_POINTER for a null
// result; E_OUTOFMEMORY, with null stored, when the string cannot be allocated.
inline HRESULT StoreNewHostString(const wchar_t* text, CvqBStr* result) noexcept {
    if (result == nullptr) {
        return E_POINTER;
    }
    *result = CvqBStrAlloc(text);
    return *result == nullptr ? E_OUTOFMEMORY : S_OK;
}
