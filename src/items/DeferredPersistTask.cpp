#include "items/DeferredPersistTask.h"

#include <utility>

#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "property/BagAccess.h"
#include "support/Sleep.h"
#include "support/TraceGate.h"
#include "vq/targetcfg/Network.h"

using namespace kest::property;

namespace kest::items {

namespace {
constexpr char kThreadName[] = "ToggleNIC";
}  // namespace

DeferredPersistTask::DeferredPersistTask(CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler,
                                         bool adapterDisabled, CountedPtr<ItemHandler> itemHandler,
                                         CountedPtr<IuxSysPropertyBag2> changes)
    : deviceHandler_(std::move(deviceHandler)),
      adapterDisabled_(adapterDisabled),
      itemHandler_(std::move(itemHandler)),
      changes_(std::move(changes)) {
    Start(kThreadName);
}

DeferredPersistTask::~DeferredPersistTask() {
    try {
        Join();
    } catch (...) {
        // Join fails only for a thread that is not joinable from here; nothing is left to wait for.
    }
}

void DeferredPersistTask::Run() {
    vq::dsc::osdep::SleepMs(kDelayBeforeDownMs);
    try {
        if (itemHandler_) {
            itemHandler_->OnDeferredPersist(changes_.Get(), deviceHandler_);
        }
    } catch (long status) {
        TraceStatus("Failed to save changes", static_cast<HRESULT>(status));
        return;
    }

    if (deviceHandler_) {
        vq::targetcfg::NarrowString interfaceName;
        deviceHandler_->GetInterfaceName(interfaceName);
        vq::targetcfg::network::SetNetworkInterfaceState(interfaceName, false);
        if (!adapterDisabled_) {
            vq::dsc::osdep::SleepMs(kDelayBeforeUpMs);
            vq::targetcfg::network::SetNetworkInterfaceState(interfaceName, true);
            if (deviceHandler_->GetDeviceType() == vq::targetcfg::kDeviceTypeEthernet && changes_) {
                try {
                    ReapplyLinkSpeed();
                } catch (long status) {
                    TraceStatus("Failed to set link speed ", static_cast<HRESULT>(status));
                }
            }
        }
    }
    deviceHandler_.Reset();
    itemHandler_.Reset();
    changes_.Reset();
}

void DeferredPersistTask::ReapplyLinkSpeed() {
    if (ReadULong(changes_.Get(), kest::tag::kAdapterMode) != kest::adapter_mode::kTcpIp) {
        return;
    }
    const uint32_t mediaMode = ReadULong(changes_.Get(), kest::tag::kPreferredMediaMode);
    ThrowIfLibraryCallFailed(vq::targetcfg::network::SetDeviceSettings(
        deviceHandler_->GetDeviceIndex(), mediaMode, 0, 0));
}

}  // namespace kest::items
