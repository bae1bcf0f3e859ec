// NetworkItemHandler::PersistPropertyChanges: writing the modified network settings at once and
// handing the adapter back for its deferred interface restart.
#include "com/CountedPtr.h"
#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "network/InterfaceSettings.h"
#include "network/NetworkItemHandler.h"
#include "property/BagAccess.h"
#include "support/StatusHolder.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/Network.h"

using namespace kest::items;
using namespace kest::network;
using namespace kest::property;

namespace {

namespace network = vq::targetcfg::network;

}  // namespace

HRESULT NetworkItemHandler::PersistPropertyChanges(
    IuxSysPropertyBag* changes, int32_t& persistFlag,
    CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler, bool& adapterDisabled) {
    if (changes == nullptr) {
        return E_POINTER;
    }
    StatusHolder status;
    status =
        ItemHandler::PersistPropertyChanges(changes, persistFlag, deviceHandler, adapterDisabled);
    CountedPtr<IuxSysEnumPropertyTag> modifiedTags = ModifiedTags(changes);
    if (!modifiedTags) {
        return S_FALSE;
    }

    try {
        // A host may persist without validating first: what would be rejected is not written.
        PropertyTagSet checked;
        status = ValidatePropertyChanges(changes, checked, nullptr);

        uint32_t primaryIndex = 0;
        ThrowIfLibraryCallFailed(network::GetPrimaryDeviceIndex(primaryIndex));
        const bool wasPrimary = DeviceIndex() == primaryIndex;

        // A false flag never takes the primary role away.
        bool primary = false;
        BagGetBool(changes, kest::tag::kPrimaryAdapter, primary);
        bool written = false;
        if (primary && !wasPrimary) {
            ThrowIfLibraryCallFailed(network::SetPrimaryDeviceByIndex(DeviceIndex()));
            status = changes->SetULong(kest::tag::kAdapterMode, kest::adapter_mode::kTcpIp);
            written = true;
        }

        bool changed = false;
        status = HaveInterfaceSettingsChanged(DeviceIndex(), changes, changed);
        if (!changed && !written) {
            return S_OK;
        }

        // Read before the new mode is stored: entering or leaving EtherCAT needs a restart.
        const uint32_t newMode = ReadULong(changes, kest::tag::kAdapterMode);
        uint32_t currentMode = 0;
        ThrowIfLibraryCallFailed(network::GetDeviceModeByIndex(DeviceIndex(), currentMode));
        const bool switchesEtherCAT =
            newMode != currentMode && (newMode == kest::adapter_mode::kEtherCAT ||
                                       currentMode == kest::adapter_mode::kEtherCAT);

        if (changed) {
            bool settingsApplied = false;
            uint32_t tag = 0;
            while (modifiedTags->Next(1, &tag, nullptr) == S_OK) {
                if (IsInterfaceSettingTag(tag)) {
                    if (!settingsApplied) {
                        settingsApplied = true;
                        status = ApplyInterfaceSettings(DeviceIndex(), changes, wasPrimary);
                        written = true;
                    }
                } else if (tag == kest::tag::kPreferredMediaMode) {
                    ThrowIfLibraryCallFailed(
                        network::SetDeviceSettings(DeviceIndex(), ReadULong(changes, tag), 0, 0));
                    written = true;
                }
            }
        }

        // A persist that wrote nothing leaves the link alone.
        if (written) {
            if (switchesEtherCAT) {
                persistFlag |= 1;
            }
            if (NeedsInterfaceRestart()) {
                deviceHandler = CountedPtr<vq::targetcfg::IDeviceHandler>(Device());
                adapterDisabled =
                    ReadULong(changes, kest::tag::kAdapterMode) == kest::adapter_mode::kDisabled;
            }
        }
    } catch (long failure) {
        TraceIfEnabled("NetworkItemHandler::PersistPropertyChanges() failed", kTraceErrors);
        return static_cast<HRESULT>(failure);
    }
    return S_OK;
}
