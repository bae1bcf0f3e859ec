// Property tags of the system and network items, written out as literal numbers so that tests
// check the plug-in's own tag table instead of repeating it.
#pragma once

#include <cstdint>

namespace kest::test::tags {

// Item identity.
constexpr uint32_t kItemName = 0x0101D000;
// System item.
constexpr uint32_t kDeviceDescription = 0x01006000;
constexpr uint32_t kSerialNumber = 0x01007000;
constexpr uint32_t kHostName = 0x0101F000;
constexpr uint32_t kFirmwareVersion = 0x0102F000;
constexpr uint32_t kComment = 0x0103D000;
constexpr uint32_t kDnsName = 0x0D114000;
constexpr uint32_t kLocaleCode = 0x0D11D000;
constexpr uint32_t kSupportedLocaleCodes = 0x0D11E000;
constexpr uint32_t kCurrentTime = 0x0D11F000;
constexpr uint32_t kLegacyTimeZone = 0x0D120000;
constexpr uint32_t kOlsonTimeZone = 0x0D14E000;
constexpr uint32_t kWebServiceEnabled = 0x21004000;
// Network item.
constexpr uint32_t kAdapterMode = 0x0D102000;
constexpr uint32_t kSupportedAdapterModes = 0x0D103000;
constexpr uint32_t kMacAddress = 0x0D104000;
constexpr uint32_t kRequestMode = 0x0D105000;
constexpr uint32_t kIPAddress = 0x0D107000;
constexpr uint32_t kSubnetMask = 0x0D109000;
constexpr uint32_t kGateway = 0x0D10A000;
constexpr uint32_t kDnsServer = 0x0D10B000;
constexpr uint32_t kPreferredMediaMode = 0x0D10F000;
constexpr uint32_t kEtherCATMasterId = 0x0D118000;
constexpr uint32_t kSupportedPollingModes = 0x0D119000;
constexpr uint32_t kPollingMode = 0x0D11A000;
constexpr uint32_t kPollingInterval = 0x0D11B000;
constexpr uint32_t kPrimaryAdapter = 0x0D126000;
constexpr uint32_t kEtherCATFlag = 0x0D155000;

}  // namespace kest::test::tags
