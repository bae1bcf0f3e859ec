#include "network/InterfaceSettings.h"

#include <string>

#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "network/IPv4Text.h"
#include "property/BagAccess.h"
#include "support/Exceptions.h"
#include "support/StatusHolder.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/Network.h"

using namespace kest::items;
using namespace kest::property;

namespace kest::network {

namespace {

using vq::dsc::osdep::IPAddress;
namespace network = vq::targetcfg::network;

// The address in the text of `tag`; the empty text gives the unset address. A failed read is
// thrown; a text that is no address raises vq::dsc::exception::InvalidArgument.
IPAddress ReadAddress(IuxSysPropertyBag* bag, uint32_t tag) {
    StatusHolder status;
    std::wstring text;
    status = BagGetWideString(bag, tag, text);
    IPAddress address;
    address.Parse(text);
    return address;
}

// As ReadAddress, but an empty text gives 0.0.0.0, the value an empty gateway or DNS server is
// stored as.
IPAddress ReadStoredAddress(IuxSysPropertyBag* bag, uint32_t tag) {
    const IPAddress address = ReadAddress(bag, tag);
    return address.IsUnset() ? ZeroIPv4Address() : address;
}

// As ReadAddress, but an empty text leaves `address` as it is.
void ReadOptionalAddress(IuxSysPropertyBag* bag, uint32_t tag, IPAddress& address) {
    StatusHolder status;
    std::wstring text;
    status = BagGetWideString(bag, tag, text);
    if (!text.empty()) {
        address.Parse(text);
    }
}

// True for the adapter modes whose selection alone counts as a change: 1, 4 and 8. Switching
// between the TCP/IP modes does not.
bool RestartsOnModeSwitch(uint32_t mode) {
    return mode == kest::adapter_mode::kDisabled || mode == 4 ||
           mode == kest::adapter_mode::kEtherCAT;
}

// True when the bag's preferred media mode differs from the adapter's current one.
bool HasMediaModeChanged(uint32_t deviceIndex, IuxSysPropertyBag* bag) {
    uint32_t newMediaMode = 0;
    if (bag->GetULong(kest::tag::kPreferredMediaMode, &newMediaMode) != S_OK) {
        return false;
    }
    uint32_t currentMediaMode = 0;
    if (network::GetCurrentDeviceSettings(deviceIndex, &currentMediaMode, nullptr, nullptr) != 0) {
        currentMediaMode = 1;
    }
    return newMediaMode != currentMediaMode;
}

// True when the static address, mask, gateway or DNS server in the bag differs from the
// adapter's. A text that is no address raises the runtime's exception.
bool HaveStaticAddressesChanged(uint32_t deviceIndex, IuxSysPropertyBag* bag) {
    const IPAddress newAddress = ReadAddress(bag, kest::tag::kIPAddress);
    const IPAddress newMask = ReadAddress(bag, kest::tag::kSubnetMask);
    const IPAddress newGateway = ReadStoredAddress(bag, kest::tag::kGateway);
    const IPAddress newDnsServer = ReadStoredAddress(bag, kest::tag::kDnsServer);

    // The adapter's addresses start as 0.0.0.0, the value its properties show when the library
    // has none, so reading those properties back is no change. An adapter without an address
    // is no failure here: any new address differs from it.
    IPAddress address = ZeroIPv4Address();
    IPAddress mask = address;
    const int32_t addressStatus =
        network::GetIPAddressByIndex(deviceIndex, 0, address, mask, nullptr);
    if (addressStatus != vq::targetcfg::status::kNoAddress) {
        ThrowIfLibraryCallFailed(addressStatus);
    }
    IPAddress gateway = ZeroIPv4Address();
    IPAddress dnsServer = gateway;
    network::GetGatewayAddressByIndex(deviceIndex, gateway);
    network::GetDNSServerAddressByIndex(deviceIndex, dnsServer);
    return newAddress != address || newMask != mask || newGateway != gateway ||
           newDnsServer != dnsServer;
}

}  // namespace

HRESULT HaveInterfaceSettingsChanged(uint32_t deviceIndex, IuxSysPropertyBag* bag, bool& changed) {
    changed = false;
    StatusHolder status;

    bool primary = false;
    status = BagGetBool(bag, kest::tag::kPrimaryAdapter, primary);
    uint32_t primaryIndex = 0;
    ThrowIfLibraryCallFailed(network::GetPrimaryDeviceIndex(primaryIndex));
    // A false flag never takes the primary role away, so only a true one on another adapter
    // changes anything.
    if (primary && primaryIndex != deviceIndex) {
        changed = true;
        return S_OK;
    }

    const uint32_t newMode = ReadULong(bag, kest::tag::kAdapterMode);
    uint32_t currentMode = 0;
    ThrowIfLibraryCallFailed(network::GetDeviceModeByIndex(deviceIndex, currentMode));
    if (newMode != currentMode && RestartsOnModeSwitch(newMode)) {
        changed = true;
        return S_OK;
    }

    const uint32_t newRequestMode = ReadULong(bag, kest::tag::kRequestMode);
    uint32_t currentRequestMode = 0;
    ThrowIfLibraryCallFailed(
        network::GetDeviceTCPIPRequestModeByIndex(deviceIndex, currentRequestMode));
    if (newRequestMode != currentRequestMode) {
        changed = true;
        return S_OK;
    }

    if (newMode == kest::adapter_mode::kTcpIp && currentMode == kest::adapter_mode::kTcpIp &&
        HasMediaModeChanged(deviceIndex, bag)) {
        changed = true;
        return S_OK;
    }
    if (newRequestMode != kest::request_mode::kStatic) {
        return S_OK;
    }

    try {
        changed = HaveStaticAddressesChanged(deviceIndex, bag);
    } catch (const vq::dsc::exception::Exception&) {
        TraceIfEnabled("NetworkItemHandler::HaveInterfaceSettingsChanged() failed", kTraceErrors);
        return E_FAIL;
    }
    return S_OK;
}

HRESULT ApplyInterfaceSettings(uint32_t deviceIndex, IuxSysPropertyBag* bag, bool wasPrimary) {
    if (bag == nullptr) {
        return E_POINTER;
    }
    IPAddress address = ZeroIPv4Address();
    IPAddress mask = address;
    IPAddress gateway = address;
    IPAddress dnsServer = address;
    uint32_t requestMode = 0;

    const uint32_t mode = ReadULong(bag, kest::tag::kAdapterMode);
    if (mode == kest::adapter_mode::kEtherCAT) {
        bool flag = false;
        BagGetBool(bag, kest::tag::kEtherCATFlag, flag);
        const uint32_t masterId = ReadULong(bag, kest::tag::kEtherCATMasterId);
        ThrowIfLibraryCallFailed(network::SetEtherCATSettings(deviceIndex, masterId, flag));
    } else if (kest::adapter_mode::IsTcpIp(mode)) {
        requestMode = ReadULong(bag, kest::tag::kRequestMode);
        if (requestMode == kest::request_mode::kStatic) {
            address = ReadAddress(bag, kest::tag::kIPAddress);
            mask = ReadAddress(bag, kest::tag::kSubnetMask);
            if (wasPrimary || BagHasTag(bag, kest::tag::kGateway)) {
                ReadOptionalAddress(bag, kest::tag::kGateway, gateway);
            }
            if (wasPrimary || BagHasTag(bag, kest::tag::kDnsServer)) {
                ReadOptionalAddress(bag, kest::tag::kDnsServer, dnsServer);
            }
        }
    }
    ThrowIfLibraryCallFailed(network::SetDeviceIPConfigByIndex(deviceIndex, 0, requestMode, mode,
                                                               address, mask, gateway, dnsServer));
    return S_OK;
}

}  // namespace kest::network
