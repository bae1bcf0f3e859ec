// The interface settings of a network adapter as one unit: adapter mode, request mode, the four
// addresses and the EtherCAT settings. Deciding whether a changes bag alters them, and storing
// them through the target-configuration library.
#pragma once

#include <cstdint>

#include "kest/ChassisTags.h"
#include "uxsys/PropertyBag.h"
#include "uxsys/Types.h"

namespace kest::network {

// True for the tags whose change is checked and applied as one set of interface settings:
// adapter mode, request mode, the four addresses and the EtherCAT settings.
constexpr bool IsInterfaceSettingTag(uint32_t tag) {
    namespace t = kest::tag;
    return tag == t::kAdapterMode || tag == t::kRequestMode || tag == t::kIPAddress ||
           tag == t::kSubnetMask || tag == t::kGateway || tag == t::kDnsServer ||
           tag == t::kEtherCATMasterId || tag == t::kEtherCATFlag;
}

// Sets `changed` when storing the settings in `bag` would alter the adapter's (device
// `deviceIndex`): the primary role given to it, a switch to adapter mode 1, 4 or 8, the request
// mode, the media mode of a mode-2 adapter, and for a static address the address, mask, gateway
// or DNS server (an empty gateway or DNS server counts as the 0.0.0.0 it is stored as). Returns
// S_OK, or E_FAIL when a non-empty address text is no address; other failures are thrown as a
// status (long).
HRESULT HaveInterfaceSettingsChanged(uint32_t deviceIndex, IuxSysPropertyBag* bag, bool& changed);

// Stores the adapter mode with its request mode and addresses (all zero unless the adapter is in
// a TCP/IP mode with a static address) and, in EtherCAT mode, the EtherCAT settings. Gateway and
// DNS server are taken when `wasPrimary` is set or the bag has them. Returns S_OK or E_POINTER;
// failures are thrown (a non-empty address text that is no address raises the runtime's
// exception).
HRESULT ApplyInterfaceSettings(uint32_t deviceIndex, IuxSysPropertyBag* bag, bool wasPrimary);

}  // namespace kest::network
