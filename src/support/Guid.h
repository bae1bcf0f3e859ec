// The runtime library's 128-bit identifier, its text form and time-based creation.
#pragma once

#include <cstdint>
#include <string>

#include "uxsys/Types.h"

namespace vq {
namespace dsc {

// 16 bytes laid out like GUID: a 32-bit field, two 16-bit fields and eight bytes.
struct Guid {
    uint32_t Data1 = 0;
    uint16_t Data2 = 0;
    uint16_t Data3 = 0;
    uint8_t Data4[8] = {};

    Guid() = default;
    Guid(const GUID& guid);  // implicit: the two are the same identifier
    operator GUID() const;

    // A new time-based (version 1) identifier: a timestamp that follows the monotonic clock, a
    // per-process clock sequence and the first network adapter's hardware address (random bytes
    // when there is none). Identifiers never repeat within the process, whichever threads ask.
    static Guid CreateTimeBased();
};

static_assert(sizeof(Guid) == sizeof(GUID), "Guid has the layout of GUID");

bool operator==(const Guid& a, const Guid& b);
inline bool operator!=(const Guid& a, const Guid& b) {
    return !(a == b);
}

// "{XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}": the three fields as numbers, then the eight bytes in
// order, upper-case hexadecimal.
std::wstring GuidToString(const Guid& guid);

}  // namespace dsc
}  // namespace vq
