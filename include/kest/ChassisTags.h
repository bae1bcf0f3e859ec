// The property tags of the chassis's items and the values of the adapter's mode properties, as
// the plug-in reports them and a host reads and changes them. A refresh request compares a tag
// only in the bits of kest::tag::kRefreshMask.
#pragma once

#include <cstdint>

namespace kest {
namespace tag {

// The bits of a requested tag that a refresh compares; the low 12 bits are ignored.
constexpr uint32_t kRefreshMask = 0xFFFFF000;

// Rows every item reports. The item's user-visible name goes under kHostName: the host name for
// the chassis, "Ethernet Adapter " and the interface name for an adapter.
constexpr uint32_t kItemName = 0x0101D000;
constexpr uint32_t kHostName = 0x0101F000;
constexpr uint32_t kNumericAttribute = 0x0102A000;
// Fixed facts every item reports and the host reads; their meaning belongs to the host.
constexpr uint32_t kItemFixedLong = 0x0101C000;
constexpr uint32_t kItemFixedULong = 0x01037000;
constexpr uint32_t kItemFixedBool = 0x01038000;
constexpr uint32_t kItemFixedLong2 = 0x01039000;
// A fixed number: 4 for the chassis, 5 for a network adapter.
constexpr uint32_t kItemFixedULong2 = 0x0103A000;

// The chassis: identity and state read from the controller and the plug-in.
constexpr uint32_t kDeviceDescription = 0x01006000;
constexpr uint32_t kTargetId = 0x01005000;
constexpr uint32_t kTargetClass = 0x0103C000;
constexpr uint32_t kVendorName = 0x01004000;
constexpr uint32_t kSerialNumber = 0x01007000;
constexpr uint32_t kFirmwareVersion = 0x0102F000;
constexpr uint32_t kSupportedLocaleCodes = 0x0D11E000;
constexpr uint32_t kTimeZoneOffset = 0x0D12B000;
// The file-name pattern of configuration files ("*.cfg").
constexpr uint32_t kConfigurationFilePattern = 0x0104B000;
// The chassis: settings the host may change (kHostName too).
constexpr uint32_t kComment = 0x0103D000;
constexpr uint32_t kLocaleCode = 0x0D11D000;
constexpr uint32_t kCurrentTime = 0x0D11F000;
constexpr uint32_t kLegacyTimeZone = 0x0D120000;
constexpr uint32_t kOlsonTimeZone = 0x0D14E000;
constexpr uint32_t kWebServiceEnabled = 0x21004000;
// The chassis: written only when a refresh asks for it (kCurrentTime too).
constexpr uint32_t kDnsName = 0x0D114000;
// The chassis: fixed facts the host reads, in the order the chassis reports them.
constexpr uint32_t kChassisFixedBool1 = 0x01001000;
constexpr uint32_t kChassisFixedLong1 = 0x01024000;
constexpr uint32_t kChassisFixedULong1 = 0x01002000;
constexpr uint32_t kChassisFixedBool2 = 0x01008000;
constexpr uint32_t kChassisFixedULong2 = 0x01003000;
constexpr uint32_t kChassisFixedBool3 = 0x0D129000;
constexpr uint32_t kChassisFixedLong2 = 0x0104C000;
constexpr uint32_t kChassisFixedBool4 = 0x0104A000;
constexpr uint32_t kChassisFixedBool5 = 0x01056000;
constexpr uint32_t kChassisFixedBool6 = 0x01055000;

// A network adapter: addresses, modes and the EtherCAT settings.
constexpr uint32_t kMacAddress = 0x0D104000;
constexpr uint32_t kPrimaryAdapter = 0x0D126000;
constexpr uint32_t kRequestMode = 0x0D105000;
constexpr uint32_t kSupportedRequestModes = 0x0D106000;
constexpr uint32_t kIPAddress = 0x0D107000;
constexpr uint32_t kSubnetMask = 0x0D109000;
constexpr uint32_t kGateway = 0x0D10A000;
constexpr uint32_t kDnsServer = 0x0D10B000;
constexpr uint32_t kPreferredMediaMode = 0x0D10F000;
constexpr uint32_t kSupportedMediaModes = 0x0D110000;
constexpr uint32_t kCurrentMediaMode = 0x0D111000;
constexpr uint32_t kEtherCATMasterId = 0x0D118000;
constexpr uint32_t kEtherCATFlag = 0x0D155000;
// A fixed fact written beside the IP address.
constexpr uint32_t kAddressFixedULong = 0x0D108000;
// The Ethernet adapter: adapter mode and polling settings.
constexpr uint32_t kAdapterMode = 0x0D102000;
constexpr uint32_t kSupportedAdapterModes = 0x0D103000;
constexpr uint32_t kSupportedPollingModes = 0x0D119000;
constexpr uint32_t kPollingMode = 0x0D11A000;
constexpr uint32_t kPollingInterval = 0x0D11B000;
// A fixed fact the Ethernet adapter reports.
constexpr uint32_t kEthernetFixedULong = 0x0D12C000;

}  // namespace tag

// Values of kest::tag::kAdapterMode; kest::tag::kSupportedAdapterModes holds them as bits.
namespace adapter_mode {

constexpr uint32_t kDisabled = 1;
constexpr uint32_t kTcpIp = 2;
constexpr uint32_t kEtherCAT = 8;
// Two further modes that carry TCP/IP addresses; what they select is the device's business.
constexpr uint32_t kTcpIpVariant1 = 0x20;
constexpr uint32_t kTcpIpVariant2 = 0x40;

// True for the modes that carry TCP/IP addresses.
constexpr bool IsTcpIp(uint32_t mode) {
    return mode == kTcpIp || mode == kTcpIpVariant1 || mode == kTcpIpVariant2;
}

}  // namespace adapter_mode

// Values of kest::tag::kRequestMode; kest::tag::kSupportedRequestModes holds them as bits.
namespace request_mode {

// A static address: the only request mode whose addresses are validated and stored.
constexpr uint32_t kStatic = 1;
// The request mode assumed when the controller reports none (an address obtained dynamically).
constexpr uint32_t kDynamic = 2;

}  // namespace request_mode

// Values of kest::tag::kPollingMode; kest::tag::kSupportedPollingModes holds them as bits.
namespace polling_mode {

// Not polled: the mode reported when the controller gives none.
constexpr uint32_t kOff = 1;
// Polled: the only mode with an interval.
constexpr uint32_t kPolling = 2;

}  // namespace polling_mode

// Values of the media-mode tags (link speed and duplex); kest::tag::kSupportedMediaModes holds
// them as bits.
namespace media_mode {

// Negotiated: also the mode reported when the controller gives none.
constexpr uint32_t kAuto = 0x01;
constexpr uint32_t kHalfDuplex10 = 0x02;
constexpr uint32_t kFullDuplex10 = 0x04;
constexpr uint32_t kHalfDuplex100 = 0x08;
constexpr uint32_t kFullDuplex100 = 0x10;
constexpr uint32_t kHalfDuplex1000 = 0x20;
constexpr uint32_t kFullDuplex1000 = 0x40;

}  // namespace media_mode
}  // namespace kest
