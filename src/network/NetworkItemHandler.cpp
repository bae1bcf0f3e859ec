#include "network/NetworkItemHandler.h"

#include <utility>

#include "items/ItemManagerBase.h"
#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "network/IPv4Text.h"
#include "property/BagAccess.h"
#include "support/StatusHolder.h"
#include "support/TextConversion.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/Network.h"

using namespace kest::items;
using namespace kest::network;
using namespace kest::property;

namespace {

namespace network = vq::targetcfg::network;
using vq::dsc::osdep::IPAddress;

// The master ID the library leaves in place when the adapter has none.
constexpr uint32_t kNoMasterId = 0xFFFFFFFF;
// The value of a media-mode query that the library cannot answer.
constexpr uint32_t kUnknownMediaMode = 1;
// Characters that must agree for a description to name an item of the same kind.
constexpr size_t kKindPrefixLength = 2;

// The tags whose refresh rewrites the network catalogue. The MAC address, the address count and
// the constant rows never change, so asking for them alone rewrites nothing.
const PropertyTagSet& NetworkRefreshTags() {
    static const PropertyTagSet tags = {
        kest::tag::kPrimaryAdapter,   kest::tag::kSupportedRequestModes,
        kest::tag::kRequestMode,      kest::tag::kIPAddress,
        kest::tag::kSubnetMask,       kest::tag::kGateway,
        kest::tag::kDnsServer,        kest::tag::kSupportedMediaModes,
        kest::tag::kCurrentMediaMode, kest::tag::kPreferredMediaMode,
        kest::tag::kEtherCATFlag,     kest::tag::kEtherCATMasterId,
    };
    return tags;
}

HRESULT SetAddressText(IuxSysPropertyBag* bag, uint32_t tag, const IPAddress& address) {
    return BagSetNarrowString(bag, tag, address.ToString());
}

}  // namespace

NetworkItemHandler::NetworkItemHandler(std::wstring itemName, std::wstring secondName,
                                       vq::targetcfg::IDeviceHandler* device)
    : ItemHandler(std::move(itemName), std::move(secondName), kNumericAttribute),
      deviceHandler_(device),
      deviceIndex_(device->GetDeviceIndex()) {}

NetworkItemHandler::~NetworkItemHandler() = default;

HRESULT NetworkItemHandler::GetItemProperties(IuxSysPropertyBag* bag) {
    StatusHolder status;
    status = ItemHandler::GetItemProperties(bag);
    status = PopulateProperties(bag);
    return S_OK;
}

HRESULT NetworkItemHandler::RefreshProperties(uint32_t count, const uint32_t* tags,
                                              IuxSysPropertyBag* bag) {
    StatusHolder status;
    status = ItemHandler::RefreshProperties(count, tags, bag);
    if (ItemManagerBase::AreTagsRequested(count, tags, NetworkRefreshTags())) {
        status = PopulateProperties(bag);
    }
    return S_OK;
}

HRESULT NetworkItemHandler::PopulateProperties(IuxSysPropertyBag* bag) {
    if (bag == nullptr) {
        return E_POINTER;
    }
    StatusHolder status;
    status = BagSetBool(bag, kest::tag::kItemFixedBool, true);
    status = bag->SetLong(kest::tag::kItemFixedLong2, 1);
    status = bag->SetULong(kest::tag::kItemFixedULong2, 5);

    vq::targetcfg::NarrowString macAddress;
    ThrowIfLibraryCallFailed(network::GetMACAddressByIndex(deviceIndex_, macAddress));
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetMACAddressByIndex",
                     macAddress.str());
    status = BagSetNarrowString(bag, kest::tag::kMacAddress, macAddress.str());

    uint32_t primaryIndex = 0;
    ThrowIfLibraryCallFailed(network::GetPrimaryDeviceIndex(primaryIndex));
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetPrimaryDeviceIndex",
                     primaryIndex);
    status = BagSetBool(bag, kest::tag::kPrimaryAdapter, deviceIndex_ == primaryIndex);

    uint32_t mode = 0;
    ThrowIfLibraryCallFailed(network::GetDeviceModeByIndex(deviceIndex_, mode));
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetDeviceModeByIndex", mode);

    // Adapters outside the TCP/IP modes keep these empty.
    for (uint32_t tag : {kest::tag::kIPAddress, kest::tag::kSubnetMask, kest::tag::kGateway,
                         kest::tag::kDnsServer}) {
        status = bag->SetString(tag, L"");
    }

    if (kest::adapter_mode::IsTcpIp(mode)) {
        PopulateTcpIpAddresses(mode, bag);
    } else if (mode == kest::adapter_mode::kEtherCAT) {
        PopulateEtherCATSettings(macAddress.str(), bag);
        PopulateTcpRequestMode(deviceIndex_, bag);
    } else {
        PopulateTcpRequestMode(deviceIndex_, bag);
    }
    return S_OK;
}

void NetworkItemHandler::PopulateTcpIpAddresses(uint32_t mode, IuxSysPropertyBag* bag) {
    StatusHolder status;
    uint32_t supportedRequestModes = 0;
    ThrowIfLibraryCallFailed(
        network::GetDeviceSupportedTCPIPRequestModesByIndex(deviceIndex_, supportedRequestModes));
    TraceLibraryCall(
        "NetworkItemHandler::PopulateProperties - GetDeviceSupportedTCPIPRequestModesByIndex",
        supportedRequestModes);
    status = bag->SetULong(kest::tag::kSupportedRequestModes, supportedRequestModes);

    uint32_t requestMode = kest::request_mode::kDynamic;
    ThrowIfLibraryCallFailed(network::GetDeviceTCPIPRequestModeByIndex(deviceIndex_, requestMode));
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetDeviceTCPIPRequestModeByIndex",
                     requestMode);
    status = bag->SetULong(kest::tag::kRequestMode, requestMode);

    IPAddress address = ZeroIPv4Address();
    IPAddress mask = ZeroIPv4Address();
    const int32_t addressStatus =
        network::GetIPAddressByIndex(deviceIndex_, 0, address, mask, nullptr);
    if (addressStatus != vq::targetcfg::status::kNoAddress) {
        ThrowIfLibraryCallFailed(addressStatus);
    }
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetIPAddressByIndex",
                     address.ToString());
    status = SetAddressText(bag, kest::tag::kIPAddress, address);
    status = bag->SetULong(kest::tag::kAddressFixedULong, 1);
    status = SetAddressText(bag, kest::tag::kSubnetMask, mask);

    IPAddress gateway = ZeroIPv4Address();
    ThrowIfLibraryCallFailed(network::GetGatewayAddressByIndex(deviceIndex_, gateway));
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetGatewayAddressByIndex",
                     gateway.ToString());
    status = SetAddressText(bag, kest::tag::kGateway, gateway);

    IPAddress dnsServer = ZeroIPv4Address();
    ThrowIfLibraryCallFailed(network::GetDNSServerAddressByIndex(deviceIndex_, dnsServer));
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetDNSServerAddressByIndex",
                     dnsServer.ToString());
    status = SetAddressText(bag, kest::tag::kDnsServer, dnsServer);

    if (mode != kest::adapter_mode::kTcpIp ||
        deviceHandler_->GetDeviceType() != vq::targetcfg::kDeviceTypeEthernet) {
        return;
    }
    uint32_t supportedMediaModes = 0;
    if (network::GetSupportedDeviceSettings(deviceIndex_, &supportedMediaModes, nullptr) != 0) {
        supportedMediaModes = kUnknownMediaMode;
    }
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetSupportedDeviceSettings",
                     supportedMediaModes);
    status = bag->SetULong(kest::tag::kSupportedMediaModes, supportedMediaModes);

    uint32_t currentMediaMode = 0;
    if (network::GetCurrentDeviceSettings(deviceIndex_, &currentMediaMode, nullptr, nullptr) != 0) {
        currentMediaMode = kUnknownMediaMode;
    }
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetCurrentDeviceSettings",
                     currentMediaMode);
    status = bag->SetULong(kest::tag::kCurrentMediaMode, currentMediaMode);

    uint32_t preferredMediaMode = 0;
    if (network::GetPreferredMediaMode(deviceIndex_, &preferredMediaMode) != 0) {
        preferredMediaMode = kUnknownMediaMode;
    }
    status = bag->SetULong(kest::tag::kPreferredMediaMode, preferredMediaMode);
}

void NetworkItemHandler::PopulateEtherCATSettings(const std::string& macAddress,
                                                  IuxSysPropertyBag* bag) {
    StatusHolder status;
    uint32_t masterId = kNoMasterId;
    bool hasFlag = false;
    bool flag = false;
    ThrowIfLibraryCallFailed(network::GetEtherCATSettings(vq::targetcfg::NarrowString(macAddress),
                                                          masterId, hasFlag, flag));
    TraceLibraryCall("NetworkItemHandler::PopulateProperties - GetEtherCATSettings", masterId);
    if (masterId != kNoMasterId) {
        status = bag->SetULong(kest::tag::kEtherCATMasterId, masterId);
    }
    if (hasFlag) {
        status = BagSetBool(bag, kest::tag::kEtherCATFlag, flag);
    }
}

void NetworkItemHandler::PopulateTcpRequestMode(uint32_t deviceIndex, IuxSysPropertyBag* bag) {
    StatusHolder status;
    uint32_t supportedRequestModes = 0;
    ThrowIfLibraryCallFailed(
        network::GetDeviceSupportedTCPIPRequestModesByIndex(deviceIndex, supportedRequestModes));
    TraceLibraryCall("PopulateTcpRequestMode - GetDeviceSupportedTCPIPRequestModesByIndex",
                     supportedRequestModes);
    status = bag->SetULong(kest::tag::kSupportedRequestModes, supportedRequestModes);

    uint32_t requestMode = 0;
    if ((supportedRequestModes & 0x2) != 0) {
        requestMode = 2;
    } else if ((supportedRequestModes & 0x1) != 0) {
        requestMode = 1;
    }
    status = bag->SetULong(kest::tag::kRequestMode, requestMode);
}

bool NetworkItemHandler::IsMatchingItem(IuxSysPropertyBag* description, bool& exactMatch) {
    StatusHolder status;
    std::wstring name;
    status = BagGetWideString(description, kest::tag::kItemName, name);
    if (HasItemName(name)) {
        exactMatch = true;
        return true;
    }
    exactMatch = false;
    const std::wstring& itemName = ItemName();
    return name.size() > kKindPrefixLength && itemName.size() > kKindPrefixLength &&
           name.compare(0, kKindPrefixLength, itemName, 0, kKindPrefixLength) == 0;
}

bool NetworkItemHandler::NeedsInterfaceRestart() {
    return true;
}

bool NetworkItemHandler::IsAdapterUp() {
    bool up = false;
    return network::GetAdapterState(deviceIndex_, up) == 0 && up;
}
