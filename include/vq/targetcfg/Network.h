// The controller's network settings, per device index (IDeviceHandler::GetDeviceIndex). A call
// with an index that names no device returns status::kInvalidArgument. Text getters replace
// their output; number, flag and address getters leave an output unchanged when the device has
// no value for it.
#pragma once

#include <cstdint>

#include "vq/targetcfg/Types.h"

namespace vq {
namespace targetcfg {
namespace network {

// The controller's fully qualified DNS name.
VQ_TARGETCFG_API int32_t GetFullyQualifiedDNSName(NarrowString& name);

// The device's hardware address as text.
VQ_TARGETCFG_API int32_t GetMACAddressByIndex(uint32_t index, NarrowString& macAddress);
// The index of the primary adapter.
VQ_TARGETCFG_API int32_t GetPrimaryDeviceIndex(uint32_t& index);
// Makes the device the primary adapter.
VQ_TARGETCFG_API int32_t SetPrimaryDeviceByIndex(uint32_t index);
// The adapter mode (2, 0x20, 0x40 TCP/IP; 8 EtherCAT; 1 disabled).
VQ_TARGETCFG_API int32_t GetDeviceModeByIndex(uint32_t index, uint32_t& mode);
// The adapter modes the device supports, as a bit mask.
VQ_TARGETCFG_API int32_t GetDeviceSupportedModesByIndex(uint32_t index, uint32_t& modes);
// The TCP/IP request mode (1 static address).
VQ_TARGETCFG_API int32_t GetDeviceTCPIPRequestModeByIndex(uint32_t index, uint32_t& requestMode);
// The request modes the device supports, as a bit mask.
VQ_TARGETCFG_API int32_t GetDeviceSupportedTCPIPRequestModesByIndex(uint32_t index,
                                                                    uint32_t& requestModes);
// The address and subnet mask in `addressSlot` (the device holds one, in slot 0). Without an
// address the result is status::kNoAddress and both outputs stay unchanged. `addressCount`
// (may be null) receives the number of addresses the device holds, also with kNoAddress.
VQ_TARGETCFG_API int32_t GetIPAddressByIndex(uint32_t index, uint32_t addressSlot,
                                             IPAddress& address, IPAddress& subnetMask,
                                             uint32_t* addressCount);
// The default gateway.
VQ_TARGETCFG_API int32_t GetGatewayAddressByIndex(uint32_t index, IPAddress& gateway);
// The DNS server.
VQ_TARGETCFG_API int32_t GetDNSServerAddressByIndex(uint32_t index, IPAddress& dnsServer);
// Stores request mode, adapter mode and the four addresses (unset addresses are stored as none).
// Only address slot 0 exists; another slot returns status::kInvalidArgument.
VQ_TARGETCFG_API int32_t SetDeviceIPConfigByIndex(uint32_t index, uint32_t addressSlot,
                                                  uint32_t requestMode, uint32_t mode,
                                                  const IPAddress& address,
                                                  const IPAddress& subnetMask,
                                                  const IPAddress& gateway,
                                                  const IPAddress& dnsServer);
// The supported media modes and polling modes (bit masks); null outputs are skipped.
VQ_TARGETCFG_API int32_t GetSupportedDeviceSettings(uint32_t index, uint32_t* mediaModes,
                                                    uint32_t* pollingModes);
// The current media mode, polling mode and polling interval (ms); null outputs are skipped.
VQ_TARGETCFG_API int32_t GetCurrentDeviceSettings(uint32_t index, uint32_t* mediaMode,
                                                  uint32_t* pollingMode, uint32_t* pollingInterval);
// The preferred media mode; a null output is skipped.
VQ_TARGETCFG_API int32_t GetPreferredMediaMode(uint32_t index, uint32_t* mediaMode);
// Stores the media mode (as preferred and, the link following it, as current), the polling mode
// and the polling interval; a 0 leaves that setting unchanged.
VQ_TARGETCFG_API int32_t SetDeviceSettings(uint32_t index, uint32_t mediaMode, uint32_t pollingMode,
                                           uint32_t pollingInterval);
// The EtherCAT settings of the device whose hardware address is `macAddress` (compared
// case-insensitively): `masterId` stays unchanged when the device has none; `hasFlag` tells
// whether the device has the flag, and `flag` is written only when it has.
VQ_TARGETCFG_API int32_t GetEtherCATSettings(NarrowString macAddress, uint32_t& masterId,
                                             bool& hasFlag, bool& flag);
// Stores the EtherCAT master ID and flag.
VQ_TARGETCFG_API int32_t SetEtherCATSettings(uint32_t index, uint32_t masterId, bool flag);
// Takes the interface named `interfaceName` (compared case-insensitively) down or up.
VQ_TARGETCFG_API int32_t SetNetworkInterfaceState(NarrowString interfaceName, bool up);
// Whether the adapter is up.
VQ_TARGETCFG_API int32_t GetAdapterState(uint32_t index, bool& up);

}  // namespace network
}  // namespace targetcfg
}  // namespace vq
