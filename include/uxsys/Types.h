// Basic types shared by the host and the plug-in: status, identifiers, timestamps, host strings.
#pragma once

#include <cstdint>

// A 32-bit status in the HRESULT layout: 0 success, 1 success with nothing done, negative failure.
typedef int32_t HRESULT;

// A 128-bit interface or class identifier; the three fields are stored little-endian.
struct GUID {
    uint32_t Data1;
    uint16_t Data2;
    uint16_t Data3;
    uint8_t Data4[8];
};
typedef GUID IID;
typedef GUID CLSID;

inline bool operator==(const GUID& a, const GUID& b) {
    const uint8_t* pa = reinterpret_cast<const uint8_t*>(&a);
    const uint8_t* pb = reinterpret_cast<const uint8_t*>(&b);
    for (unsigned i = 0; i < sizeof(GUID); ++i) {
        if (pa[i] != pb[i]) {
            return false;
        }
    }
    return true;
}
inline bool operator!=(const GUID& a, const GUID& b) {
    return !(a == b);
}

// Signed 64.64 fixed-point seconds since 1904-01-01 00:00:00 UTC; all zero means "no time".
struct uxSysAttrTimestampUTC {
    uint64_t fraction;
    int64_t seconds;
};

// Host string: points at the first wide character of a malloc'ed block laid out as
// [uint32_t count][count characters][L'\0']. See uxsys/HostString.h.
typedef wchar_t* CvqBStr;

static_assert(sizeof(GUID) == 16, "GUID must be 16 bytes");
static_assert(sizeof(uxSysAttrTimestampUTC) == 16, "timestamp must be 16 bytes");
static_assert(sizeof(wchar_t) == 4, "host strings use 32-bit characters");
