#include "network/InterfaceSettings.h"

#include <string>

#include "network/BagReading.h"
#include "network/IPv4Text.h"
#include "network/LibraryCall.h"
#include "network/NetworkTags.h"
#include "property/BagAccess.h"
#include "support/Exceptions.h"
#include "support/StatusHolder.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/Network.h"

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
    return mode == AdapterMode::kDisabled || mode == 4 || mode == AdapterMode::kEtherCAT;
}

// True when the bag's preferred media mode differs from the adapter's current one.
bool HasMediaModeChanged(uint32_t deviceIndex, IuxSysPropertyBag* bag) {
    uint32_t newMediaMode = 0;
    if (bag->GetULong(NetworkTag::kPreferredMediaMode, &newMediaMode) != S_OK) {
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
    const IPAddress newAddress = ReadAddress(bag, NetworkTag::kIPAddress);
    const IPAddress newMask = ReadAddress(bag, NetworkTag::kSubnetMask);
    const IPAddress newGateway = ReadStoredAddress(bag, NetworkTag::kGateway);
    const IPAddress newDnsServer = ReadStoredAddress(bag, NetworkTag::kDnsServer);

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
    status = BagGetBool(bag, NetworkTag::kPrimaryAdapter, primary);
    uint32_t primaryIndex = 0;
    ThrowIfLibraryCallFailed(network::GetPrimaryDeviceIndex(primaryIndex));
    // A false flag never takes the primary role away, so only a true one on another adapter
    // changes anything.
    if (primary && primaryIndex != deviceIndex) {
        changed = true;
        return S_OK;
    }

    const uint32_t newMode = ReadULong(bag, NetworkTag::kAdapterMode);
    uint32_t currentMode = 0;
    ThrowIfLibraryCallFailed(network::GetDeviceModeByIndex(deviceIndex, currentMode));
    if (newMode != currentMode && RestartsOnModeSwitch(newMode)) {
        changed = true;
        return S_OK;
    }

    const uint32_t newRequestMode = ReadULong(bag, NetworkTag::kRequestMode);
    uint32_t currentRequestMode = 0;
    ThrowIfLibraryCallFailed(
        network::GetDeviceTCPIPRequestModeByIndex(deviceIndex, currentRequestMode));
    if (newRequestMode != currentRequestMode) {
        changed = true;
        return S_OK;
    }

    if (newMode == AdapterMode::kTcpIp && currentMode == AdapterMode::kTcpIp &&
        HasMediaModeChanged(deviceIndex, bag)) {
        changed = true;
        return S_OK;
    }
    if (newRequestMode != RequestMode::kStatic) {
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

    const uint32_t mode = ReadULong(bag, NetworkTag::kAdapterMode);
    if (mode == AdapterMode::kEtherCAT) {
        bool flag = false;
        BagGetBool(bag, NetworkTag::kEtherCATFlag, flag);
        const uint32_t masterId = ReadULong(bag, NetworkTag::kEtherCATMasterId);
        ThrowIfLibraryCallFailed(network::SetEtherCATSettings(deviceIndex, masterId, flag));
    } else if (AdapterMode::IsTcpIp(mode)) {
        requestMode = ReadULong(bag, NetworkTag::kRequestMode);
        if (requestMode == RequestMode::kStatic) {
            address = ReadAddress(bag, NetworkTag::kIPAddress);
            mask = ReadAddress(bag, NetworkTag::kSubnetMask);
            if (wasPrimary || BagHasTag(bag, NetworkTag::kGateway)) {
                ReadOptionalAddress(bag, NetworkTag::kGateway, gateway);
            }
            if (wasPrimary || BagHasTag(bag, NetworkTag::kDnsServer)) {
                ReadOptionalAddress(bag, NetworkTag::kDnsServer, dnsServer);
            }
        }
    }
    ThrowIfLibraryCallFailed(network::SetDeviceIPConfigByIndex(deviceIndex, 0, requestMode, mode,
                                                               address, mask, gateway, dnsServer));
    return S_OK;
}
