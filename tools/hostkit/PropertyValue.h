// One typed property value as kestcfg holds it: the seven kinds a property bag stores, in the
// order of their type codes (boolean 1 to timestamp 7).
#pragma once

#include <cstdint>
#include <string>
#include <variant>

#include "uxsys/PropertyBag.h"
#include "uxsys/Types.h"

namespace kest::hostkit {

using PropertyValue =
    std::variant<bool, int32_t, uint32_t, double, GUID, std::wstring, uxSysAttrTimestampUTC>;

static_assert(std::variant_size_v<PropertyValue> == UX_PROPERTY_TYPE_TIMESTAMP,
              "one alternative per type code");

// The bag type code of the value's kind.
inline uint32_t TypeCodeOf(const PropertyValue& value) {
    return static_cast<uint32_t>(value.index()) + UX_PROPERTY_TYPE_BOOL;
}

// True for the type codes 1 to 7.
inline bool IsKnownTypeCode(uint32_t type) {
    return type >= UX_PROPERTY_TYPE_BOOL && type <= UX_PROPERTY_TYPE_TIMESTAMP;
}

}  // namespace kest::hostkit
