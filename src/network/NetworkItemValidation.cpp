// NetworkItemHandler::ValidatePropertyChanges: which tags of a changes bag the network side
// accepts, and the checks they pass through.
#include "com/CountedPtr.h"
#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "network/InterfaceSettings.h"
#include "network/NetworkItemHandler.h"
#include "network/NetworkSettingsValidation.h"
#include "property/BagAccess.h"
#include "support/StatusHolder.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/Network.h"

using namespace kest::items;
using namespace kest::network;
using namespace kest::property;

namespace {

// True for the media modes an adapter may be asked for.
bool IsAcceptedMediaMode(uint32_t mediaMode) {
    switch (mediaMode) {
        case 0:
        case 1:
        case 2:
        case 4:
        case 8:
        case 0x10:
        case 0x20:
        case 0x40:
            return true;
        default:
            return false;
    }
}

}  // namespace

HRESULT NetworkItemHandler::ValidatePropertyChanges(IuxSysPropertyBag* changes,
                                                    PropertyTagSet& validated, CvqBStr* message) {
    if (changes == nullptr) {
        return E_POINTER;
    }
    StatusHolder status;
    status = ItemHandler::ValidatePropertyChanges(changes, validated, message);
    CountedPtr<IuxSysEnumPropertyTag> tags;
    status = changes->GetTagEnumerator(tags.Receive());
    if (!tags) {
        return S_OK;
    }

    try {
        // Making this adapter primary is a change of its own: nothing else is checked with it.
        if (EnumeratorHasTag(tags.Get(), kest::tag::kPrimaryAdapter)) {
            bool primary = false;
            status = BagGetBool(changes, kest::tag::kPrimaryAdapter, primary);
            uint32_t primaryIndex = 0;
            ThrowIfLibraryCallFailed(vq::targetcfg::network::GetPrimaryDeviceIndex(primaryIndex));
            validated.insert(kest::tag::kPrimaryAdapter);
            if (primary && DeviceIndex() != primaryIndex) {
                return S_OK;
            }
        }

        status = tags->Reset();
        bool settingsChecked = false;
        uint32_t tag = 0;
        while (tags->Next(1, &tag, nullptr) == S_OK) {
            if (IsInterfaceSettingTag(tag)) {
                if (!settingsChecked) {
                    settingsChecked = true;
                    status = ValidateNetworkSettings(DeviceIndex(), changes, message);
                }
                validated.insert(tag);
            } else if (tag == kest::tag::kPreferredMediaMode) {
                if (!IsAcceptedMediaMode(ReadULong(changes, tag))) {
                    status = UX_E_VALUE_INVALID;
                }
                validated.insert(tag);
            }
        }
    } catch (long failure) {
        TraceIfEnabled("NetworkItemHandler::ValidatePropertyChanges() failed", kTraceErrors);
        return static_cast<HRESULT>(failure);
    }
    return S_OK;
}
