// The handler of a network adapter item: it holds the controller library's device object and
// the device index that every network call of the adapter takes.
#pragma once

#include <cstdint>
#include <string>

#include "com/CountedPtr.h"
#include "items/ItemHandler.h"
#include "vq/targetcfg/DeviceHandler.h"

class NetworkItemHandler : public ItemHandler {
  public:
    // A persisted change of this item restarts the network interface; always true.
    virtual bool NeedsInterfaceRestart();
    // True only when the library reports the adapter up.
    virtual bool IsAdapterUp();

    // The device index read from the device at construction.
    uint32_t DeviceIndex() const noexcept { return deviceIndex_; }

  protected:
    // Keeps a reference to `device` and reads its device index.
    NetworkItemHandler(std::wstring itemName, std::wstring secondName,
                       vq::targetcfg::IDeviceHandler* device);
    ~NetworkItemHandler() override;

    // The library's device object of this adapter.
    vq::targetcfg::IDeviceHandler* Device() const noexcept { return deviceHandler_.Get(); }

  private:
    CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler_;
    uint32_t deviceIndex_;
};
