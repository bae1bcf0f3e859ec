#include "network/NetworkSettingsValidation.h"

#include <string>

#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "network/AddressRules.h"
#include "network/IPv4Text.h"
#include "property/BagAccess.h"
#include "property/HostStringResult.h"
#include "support/StatusHolder.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/Network.h"

using namespace kest::items;
using namespace kest::property;

namespace kest::network {

namespace {

constexpr wchar_t kRequestModeNotSupported[] = L"IP address request mode is not supported";
constexpr wchar_t kAddressHostPartInvalid[] =
    L"The specified IP address and subnet mask combination is invalid. The right-most bits of the "
    L"IP address must not be all 0 or all 1.";
constexpr wchar_t kGatewayHostPartInvalid[] =
    L"The specified gateway and subnet mask combination is invalid. The right-most bits of the "
    L"gateway must not be all 0 or all 1.";
constexpr wchar_t kDifferentSubnets[] = L"The IP address and gateway must be on the same subnet.";
constexpr wchar_t kMasterIdOutOfRange[] = L"EtherCAT Master ID must be between 0 and 255.";

constexpr uint32_t kHighestMasterId = 255;

[[noreturn]] void ThrowStatus(HRESULT status) {
    throw static_cast<long>(status);
}

// Stores `text` as the message and throws `status`.
[[noreturn]] void Reject(CvqBStr* message, const wchar_t* text, HRESULT status) {
    StoreValidationMessage(message, text);
    ThrowStatus(status);
}

bool IsAcceptedRequestMode(uint32_t requestMode) {
    return requestMode == 1 || requestMode == 2 || requestMode == 4 || requestMode == 8;
}

// The gateway against the static address and mask; a gateway of 0.0.0.0 means none.
void ValidateGateway(const std::wstring& address, const std::wstring& mask,
                     const std::wstring& gateway, CvqBStr* message) {
    if (!IsValidIPv4Text(gateway, true, false, true)) {
        ThrowStatus(UX_E_GATEWAY_INVALID);
    }
    switch (CheckAddressAndGateway(ParseIPv4(address), ParseIPv4(mask), ParseIPv4(gateway))) {
        case AddressPairFault::kAddressHostPart:
            Reject(message, kAddressHostPartInvalid, UX_E_ADDRESS_COMBINATION_INVALID);
        case AddressPairFault::kGatewayHostPart:
            Reject(message, kGatewayHostPartInvalid, UX_E_ADDRESS_COMBINATION_INVALID);
        case AddressPairFault::kDifferentSubnets:
            Reject(message, kDifferentSubnets, UX_E_ADDRESS_COMBINATION_INVALID);
        case AddressPairFault::kNone:
            break;
    }
}

// Gateway and DNS server of a static configuration. The primary adapter must have both; another
// adapter may leave either empty.
void ValidateGatewayDNSHelper(IuxSysPropertyBag* bag, const std::wstring& address,
                              const std::wstring& mask, CvqBStr* message) {
    try {
        StatusHolder status;
        bool primary = false;
        BagGetBool(bag, kest::tag::kPrimaryAdapter, primary);
        if (primary || BagHasTag(bag, kest::tag::kGateway)) {
            std::wstring gateway;
            status = BagGetWideString(bag, kest::tag::kGateway, gateway);
            if (primary || !gateway.empty()) {
                ValidateGateway(address, mask, gateway, message);
            }
        }
        if (primary || BagHasTag(bag, kest::tag::kDnsServer)) {
            std::wstring dnsServer;
            status = BagGetWideString(bag, kest::tag::kDnsServer, dnsServer);
            if ((primary || !dnsServer.empty()) && !IsValidIPv4Text(dnsServer, true, true, false)) {
                ThrowStatus(UX_E_DNS_ADDRESS_INVALID);
            }
        }
    } catch (long) {
        TraceLineIfEnabled("ValidateGatewayDNSHelper() failed", kTraceErrors);
        throw;
    }
}

}  // namespace

HRESULT ValidateNetworkSettings(uint32_t deviceIndex, IuxSysPropertyBag* bag, CvqBStr* message) {
    if (bag == nullptr) {
        return E_POINTER;
    }
    const uint32_t adapterMode = ReadULong(bag, kest::tag::kAdapterMode);
    if (adapterMode == kest::adapter_mode::kEtherCAT) {
        if (ReadULong(bag, kest::tag::kEtherCATMasterId) > kHighestMasterId) {
            Reject(message, kMasterIdOutOfRange, UX_E_VALUE_INVALID);
        }
        return S_OK;
    }
    if (adapterMode != kest::adapter_mode::kTcpIp &&
        adapterMode != kest::adapter_mode::kTcpIpVariant1) {
        return S_OK;
    }

    const uint32_t requestMode = ReadULong(bag, kest::tag::kRequestMode);
    if (!IsAcceptedRequestMode(requestMode)) {
        ThrowStatus(UX_E_VALUE_INVALID);
    }
    uint32_t supportedRequestModes = 0;
    ThrowIfLibraryCallFailed(vq::targetcfg::network::GetDeviceSupportedTCPIPRequestModesByIndex(
        deviceIndex, supportedRequestModes));
    if (supportedRequestModes != 0 && (supportedRequestModes & requestMode) == 0) {
        StoreValidationMessage(message, kRequestModeNotSupported);
        TraceLineIfEnabled("NetworkItemHandler::ValidateNetworkSettings() failed", kTraceErrors);
        return UX_E_VALUE_INVALID;
    }
    if (requestMode != kest::request_mode::kStatic) {
        return S_OK;
    }

    std::wstring address;
    BagGetWideString(bag, kest::tag::kIPAddress, address);
    if (!IsValidIPv4Text(address, false, false, true)) {
        ThrowStatus(UX_E_IP_ADDRESS_INVALID);
    }
    std::wstring mask;
    BagGetWideString(bag, kest::tag::kSubnetMask, mask);
    if (!IsValidIPv4Text(mask, false, false, true) || !IsContiguousSubnetMask(ParseIPv4(mask))) {
        ThrowStatus(UX_E_SUBNET_MASK_INVALID);
    }
    ValidateGatewayDNSHelper(bag, address, mask, message);
    return S_OK;
}

}  // namespace kest::network
