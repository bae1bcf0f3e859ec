#include "network/EthernetItemHandler.h"

#include <utility>

#include "items/ItemManagerBase.h"
#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "property/BagAccess.h"
#include "property/HostStringResult.h"
#include "support/StatusHolder.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/Network.h"

using namespace kest::items;
using namespace kest::property;

namespace {

namespace network = vq::targetcfg::network;

constexpr uint32_t kDefaultSupportedAdapterModes = 3;
constexpr uint32_t kShortestPollingIntervalMs = 1;
constexpr uint32_t kLongestPollingIntervalMs = 10000;
constexpr wchar_t kPollingIntervalOutOfRange[] =
    L"Polling interval must be between 1 and 10000 ms.";

// The tags whose refresh rewrites the Ethernet rows.
const PropertyTagSet& EthernetRefreshTags() {
    static const PropertyTagSet tags = {kest::tag::kAdapterMode, kest::tag::kPollingInterval,
                                        kest::tag::kSupportedPollingModes, kest::tag::kPollingMode};
    return tags;
}

[[noreturn]] void ThrowStatus(HRESULT status) {
    throw static_cast<long>(status);
}

bool IsAcceptedPollingMode(uint32_t pollingMode) {
    return pollingMode == 1 || pollingMode == kest::polling_mode::kPolling || pollingMode == 4;
}

}  // namespace

EthernetItemHandler::EthernetItemHandler(std::wstring itemName, std::wstring secondName,
                                         vq::targetcfg::IDeviceHandler* device)
    : NetworkItemHandler(std::move(itemName), std::move(secondName), device) {}

EthernetItemHandler::~EthernetItemHandler() = default;

HRESULT EthernetItemHandler::GetItemProperties(IuxSysPropertyBag* bag) {
    StatusHolder status;
    status = NetworkItemHandler::GetItemProperties(bag);
    return PopulateProperties(bag);
}

HRESULT EthernetItemHandler::RefreshProperties(uint32_t count, const uint32_t* tags,
                                               IuxSysPropertyBag* bag) {
    StatusHolder status;
    status = NetworkItemHandler::RefreshProperties(count, tags, bag);
    if (ItemManagerBase::AreTagsRequested(count, tags, EthernetRefreshTags())) {
        status = PopulateProperties(bag);
    }
    return S_OK;
}

HRESULT EthernetItemHandler::PopulateProperties(IuxSysPropertyBag* bag) {
    if (bag == nullptr) {
        return E_POINTER;
    }
    StatusHolder status;
    status = bag->SetULong(kest::tag::kEthernetFixedULong, 1);

    uint32_t mode = kest::adapter_mode::kTcpIp;
    ThrowIfLibraryCallFailed(network::GetDeviceModeByIndex(DeviceIndex(), mode));
    TraceLibraryCall("EthernetItemHandler::PopulateProperties - GetDeviceModeByIndex", mode);
    uint32_t supportedModes = kDefaultSupportedAdapterModes;
    ThrowIfLibraryCallFailed(
        network::GetDeviceSupportedModesByIndex(DeviceIndex(), supportedModes));
    TraceLibraryCall("EthernetItemHandler::PopulateProperties - GetDeviceSupportedModesByIndex",
                     supportedModes);
    status = bag->SetULong(kest::tag::kAdapterMode, mode);
    status = bag->SetULong(kest::tag::kSupportedAdapterModes, supportedModes);

    uint32_t supportedPollingModes = kest::polling_mode::kOff;
    uint32_t pollingMode = kest::polling_mode::kOff;
    if (mode == kest::adapter_mode::kTcpIp) {
        if (network::GetSupportedDeviceSettings(DeviceIndex(), nullptr, &supportedPollingModes) !=
            0) {
            supportedPollingModes = kest::polling_mode::kOff;
        }
        TraceLibraryCall("EthernetItemHandler::PopulateProperties - GetSupportedDeviceSettings",
                         supportedPollingModes);
        uint32_t interval = 0;
        if (network::GetCurrentDeviceSettings(DeviceIndex(), nullptr, &pollingMode, &interval) !=
            0) {
            pollingMode = kest::polling_mode::kOff;
        }
        TraceLibraryCall("EthernetItemHandler::PopulateProperties - GetCurrentDeviceSettings",
                         pollingMode);
        if (pollingMode == kest::polling_mode::kPolling) {
            status = bag->SetULong(kest::tag::kPollingInterval, interval);
        }
    }
    status = bag->SetULong(kest::tag::kSupportedPollingModes, supportedPollingModes);
    status = bag->SetULong(kest::tag::kPollingMode, pollingMode);
    return S_OK;
}

HRESULT EthernetItemHandler::ValidatePropertyChanges(IuxSysPropertyBag* changes,
                                                     PropertyTagSet& validated, CvqBStr* message) {
    if (changes == nullptr) {
        return E_POINTER;
    }
    StatusHolder status;
    status = NetworkItemHandler::ValidatePropertyChanges(changes, validated, message);
    CountedPtr<IuxSysEnumPropertyTag> tags;
    status = changes->GetTagEnumerator(tags.Receive());
    if (!tags) {
        return S_OK;
    }
    uint32_t tag = 0;
    while (tags->Next(1, &tag, nullptr) == S_OK) {
        if (tag == kest::tag::kPollingMode) {
            const uint32_t pollingMode = ReadULong(changes, tag);
            if (!IsAcceptedPollingMode(pollingMode) ||
                (pollingMode & ReadULong(changes, kest::tag::kSupportedPollingModes)) == 0) {
                ThrowStatus(UX_E_VALUE_INVALID);
            }
            validated.insert(tag);
        } else if (tag == kest::tag::kPollingInterval) {
            const uint32_t interval = ReadULong(changes, tag);
            if (interval < kShortestPollingIntervalMs || interval > kLongestPollingIntervalMs) {
                StoreValidationMessage(message, kPollingIntervalOutOfRange);
                ThrowStatus(UX_E_VALUE_INVALID);
            }
            validated.insert(tag);
        } else if (tag == kest::tag::kAdapterMode) {
            const uint32_t mode = ReadULong(changes, tag);
            if ((mode & ReadULong(changes, kest::tag::kSupportedAdapterModes)) == 0) {
                ThrowStatus(UX_E_VALUE_INVALID);
            }
            validated.insert(tag);
        }
    }
    return S_OK;
}

HRESULT EthernetItemHandler::PersistPropertyChanges(
    IuxSysPropertyBag* changes, int32_t& persistFlag,
    CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler, bool& adapterDisabled) {
    if (changes == nullptr) {
        return E_POINTER;
    }
    StatusHolder status;
    status = NetworkItemHandler::PersistPropertyChanges(changes, persistFlag, deviceHandler,
                                                        adapterDisabled);
    CountedPtr<IuxSysEnumPropertyTag> modifiedTags = ModifiedTags(changes);
    if (!modifiedTags) {
        return S_OK;
    }
    bool pollingModified = false;
    uint32_t tag = 0;
    while (!pollingModified && modifiedTags->Next(1, &tag, nullptr) == S_OK) {
        pollingModified = tag == kest::tag::kPollingMode || tag == kest::tag::kPollingInterval;
    }
    if (!pollingModified) {
        return S_OK;
    }
    const uint32_t pollingMode = ReadULong(changes, kest::tag::kPollingMode);
    const uint32_t interval = pollingMode == kest::polling_mode::kPolling
                                  ? ReadULong(changes, kest::tag::kPollingInterval)
                                  : 0;
    ThrowIfLibraryCallFailed(network::SetDeviceSettings(DeviceIndex(), 0, pollingMode, interval));
    return S_OK;
}
