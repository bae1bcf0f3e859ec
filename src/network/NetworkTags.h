// Property tags of the network adapter item and the adapter, request and polling mode values
// the handlers treat specially.
#pragma once

#include <cstdint>

namespace NetworkTag {

// Constant rows every network item reports.
constexpr uint32_t kConstantTrue = 0x01038000;
constexpr uint32_t kConstantOne = 0x01039000;
constexpr uint32_t kConstantFive = 0x0103A000;
// The item name row written by every handler (read back when matching descriptions).
constexpr uint32_t kItemName = 0x0101D000;

constexpr uint32_t kAdapterMode = 0x0D102000;
constexpr uint32_t kSupportedAdapterModes = 0x0D103000;
constexpr uint32_t kMacAddress = 0x0D104000;
constexpr uint32_t kRequestMode = 0x0D105000;
constexpr uint32_t kSupportedRequestModes = 0x0D106000;
constexpr uint32_t kIPAddress = 0x0D107000;
// Written as 1 beside the IP address.
constexpr uint32_t kAddressCount = 0x0D108000;
constexpr uint32_t kSubnetMask = 0x0D109000;
constexpr uint32_t kGateway = 0x0D10A000;
constexpr uint32_t kDnsServer = 0x0D10B000;
constexpr uint32_t kPreferredMediaMode = 0x0D10F000;
constexpr uint32_t kSupportedMediaModes = 0x0D110000;
constexpr uint32_t kCurrentMediaMode = 0x0D111000;
constexpr uint32_t kEtherCATMasterId = 0x0D118000;
constexpr uint32_t kSupportedPollingModes = 0x0D119000;
constexpr uint32_t kPollingMode = 0x0D11A000;
constexpr uint32_t kPollingInterval = 0x0D11B000;
constexpr uint32_t kPrimaryAdapter = 0x0D126000;
// Written as 1 by the Ethernet adapter item.
constexpr uint32_t kEthernetConstantOne = 0x0D12C000;
constexpr uint32_t kEtherCATFlag = 0x0D155000;

// True for the tags whose change is checked and applied as one set of interface settings:
// adapter mode, request mode, the four addresses and the EtherCAT settings.
constexpr bool IsInterfaceSettingTag(uint32_t tag) {
    return tag == kAdapterMode || tag == kRequestMode || tag == kIPAddress || tag == kSubnetMask ||
           tag == kGateway || tag == kDnsServer || tag == kEtherCATMasterId || tag == kEtherCATFlag;
}

}  // namespace NetworkTag

namespace AdapterMode {

constexpr uint32_t kDisabled = 1;
constexpr uint32_t kTcpIp = 2;
constexpr uint32_t kEtherCAT = 8;
constexpr uint32_t kTcpIp20 = 0x20;
constexpr uint32_t kTcpIp40 = 0x40;

// True for the modes that carry TCP/IP addresses.
constexpr bool IsTcpIp(uint32_t mode) {
    return mode == kTcpIp || mode == kTcpIp20 || mode == kTcpIp40;
}

}  // namespace AdapterMode

namespace RequestMode {

// A static address: the only request mode whose addresses are validated and stored.
constexpr uint32_t kStatic = 1;
// The request mode assumed when the library reports none.
constexpr uint32_t kDefault = 2;

}  // namespace RequestMode

namespace PollingMode {

// The mode reported when the library gives none.
constexpr uint32_t kNone = 1;
// Polling: the only mode with an interval.
constexpr uint32_t kPolling = 2;

}  // namespace PollingMode
