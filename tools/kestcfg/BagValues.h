// Reading and writing typed values through any property bag's interfaces, and listing tags.
#pragma once

#include <cstdint>
#include <vector>

#include "hostkit/PropertyValue.h"
#include "uxsys/Enumerators.h"
#include "uxsys/PropertyBag.h"

namespace kest::cfg {

// Reads the tag's value with the bag's getter for the tag's type code. Returns the status of the
// failing bag operation, E_UNEXPECTED for a type code outside 1 to 7, or S_OK.
HRESULT ReadBagValue(IuxSysPropertyBag2* bag, uint32_t tag, kest::hostkit::PropertyValue* value);

// Writes the value with the bag's setter for its type; returns the setter's status.
HRESULT WriteBagValue(IuxSysPropertyBag2* bag, uint32_t tag,
                      const kest::hostkit::PropertyValue& value);

// All tags an enumerator yields from its current position on, reading one at a time. A null
// enumerator yields none. Throws a failure when the enumerator reports an error.
std::vector<uint32_t> RemainingTags(IuxSysEnumPropertyTag* tags);

// All tags of the bag in the bag's order. Throws a failure when the bag reports an error.
std::vector<uint32_t> AllTags(IuxSysPropertyBag* bag);

}  // namespace kest::cfg
