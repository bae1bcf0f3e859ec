// Convenience access to any property bag for the item handlers: booleans as bool, strings as
// std::wstring or locale-encoded std::string, tag lookup in a tag enumerator, and the bag's
// second interface (timestamps and the modified set).
#pragma once

#include <cstdint>
#include <string>

#include "com/CountedPtr.h"
#include "uxsys/Enumerators.h"
#include "uxsys/PropertyBag.h"

namespace kest::property {

// The unsigned value of `tag`, preset to `preset`; a failed read is thrown as a status (long).
uint32_t ReadULong(IuxSysPropertyBag* bag, uint32_t tag, uint32_t preset = 0);
// An enumerator over the modified tags of `bag` in ascending order, or null when none is
// modified. A bag without the modified-set interface gives E_NOINTERFACE; failures are thrown.
CountedPtr<IuxSysEnumPropertyTag> ModifiedTags(IuxSysPropertyBag* bag);
// The bag's IuxSysPropertyBag2 interface; a null bag or one that does not offer it throws
// E_NOINTERFACE as a status (long).
CountedPtr<IuxSysPropertyBag2> QueryPropertyBag2(IuxSysPropertyBag* bag);
// Reads a boolean; `value` is false unless the bag holds a true value. Returns GetBool's status.
HRESULT BagGetBool(IuxSysPropertyBag* bag, uint32_t tag, bool& value);
// Stores a boolean; returns SetBool's status.
HRESULT BagSetBool(IuxSysPropertyBag* bag, uint32_t tag, bool value);
// True exactly when HasTag reports the tag present.
bool BagHasTag(IuxSysPropertyBag* bag, uint32_t tag);
// Reads a string; `value` is emptied when the read fails. Returns GetString's status.
HRESULT BagGetWideString(IuxSysPropertyBag* bag, uint32_t tag, std::wstring& value);
// As BagGetWideString, converted to narrow text in the locale's character set.
HRESULT BagGetNarrowString(IuxSysPropertyBag* bag, uint32_t tag, std::string& value);
// Stores a string; returns SetString's status.
HRESULT BagSetWideString(IuxSysPropertyBag* bag, uint32_t tag, const std::wstring& value);
// Stores narrow text converted from the locale's character set; returns SetString's status.
HRESULT BagSetNarrowString(IuxSysPropertyBag* bag, uint32_t tag, const std::string& value);
// True when the enumerator yields `tag` after a Reset; false for a null enumerator or when Next
// stops before the tag appears. Leaves the enumerator's position after the tag or at the end.
bool EnumeratorHasTag(IuxSysEnumPropertyTag* tags, uint32_t tag);

}  // namespace kest::property
