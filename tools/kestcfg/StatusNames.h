// Status codes as people read them: by name and number.
#pragma once

#include <string>

#include "uxsys/Types.h"

namespace kest::cfg {

// The status's symbolic name ("UX_E_VALUE_INVALID"), or empty for a code kestcfg does not know.
std::string StatusName(HRESULT status);

// The name and the number, for example "UX_E_VALUE_INVALID (0x8004037F)"; the number alone for
// an unknown code.
std::string StatusWithName(HRESULT status);

// True for the statuses with which the plug-in rejects a property value as unacceptable.
bool IsValueRejection(HRESULT status);

}  // namespace kest::cfg
