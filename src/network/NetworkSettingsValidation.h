// The check of a network adapter's settings as a whole: adapter mode, TCP/IP request mode, the
// static address with its mask, gateway and DNS server, and the EtherCAT master ID.
#pragma once

#include <cstdint>

#include "uxsys/PropertyBag.h"
#include "uxsys/Types.h"

namespace kest::network {

// Checks the settings in `bag` for the adapter with `deviceIndex`. Returns S_OK, E_POINTER for a
// null bag, or UX_E_VALUE_INVALID for a request mode the adapter does not offer; every other
// violation is thrown as a status (long). `message` (may be null) receives a new host string for
// the rules that explain themselves.
HRESULT ValidateNetworkSettings(uint32_t deviceIndex, IuxSysPropertyBag* bag, CvqBStr* message);

}  // namespace kest::network
