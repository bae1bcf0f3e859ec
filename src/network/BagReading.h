// Reads from a changes bag whose failures travel as a thrown status (long).
#pragma once

#include <cstdint>

#include "com/CountedPtr.h"
#include "uxsys/Enumerators.h"
#include "uxsys/PropertyBag.h"

// The unsigned value of `tag`, preset to `preset`; a failed read is thrown.
uint32_t ReadULong(IuxSysPropertyBag* bag, uint32_t tag, uint32_t preset = 0);

// An enumerator over the modified tags of `bag` in ascending order, or null when none is
// modified. A bag without the modified-set interface gives E_NOINTERFACE; failures are thrown.
CountedPtr<IuxSysEnumPropertyTag> ModifiedTags(IuxSysPropertyBag* bag);
