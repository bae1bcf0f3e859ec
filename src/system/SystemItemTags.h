// Property tags of the system item (the chassis itself).
#pragma once

#include <cstdint>

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace SystemTag {

// Identity and state read from the controller and the plug-in.
constexpr uint32_t kDeviceDescription = 0x01006000;
constexpr uint32_t kTargetId = 0x01005000;
constexpr uint32_t kTargetClass = 0x0103C000;
constexpr uint32_t kVendorName = 0x01004000;
constexpr uint32_t kSerialNumber = 0x01007000;
constexpr uint32_t kFirmwareVersion = 0x0102F000;
constexpr uint32_t kSupportedLocaleCodes = 0x0D11E000;
constexpr uint32_t kTimeZoneOffset = 0x0D12B000;

// Settings the host may change.
constexpr uint32_t kHostName = 0x0101F000;
constexpr uint32_t kComment = 0x0103D000;
constexpr uint32_t kLocaleCode = 0x0D11D000;
constexpr uint32_t kCurrentTime = 0x0D11F000;
constexpr uint32_t kLegacyTimeZone = 0x0D120000;
constexpr uint32_t kOlsonTimeZone = 0x0D14E000;
constexpr uint32_t kWebServiceEnabled = 0x21004000;

// Written only when a refresh asks for it.
constexpr uint32_t kDnsName = 0x0D114000;

// The bits a refresh request ignores when it names a tag.
constexpr uint32_t kRefreshTagMask = 0xFFFFF000;

}  // namespace SystemTag
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
