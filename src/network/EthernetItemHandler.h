// The handler of the Ethernet adapter item.
#pragma once

#include <string>

#include "network/NetworkItemHandler.h"
#include "vq/targetcfg/DeviceHandler.h"

class EthernetItemHandler : public NetworkItemHandler {
  public:
    // The item named `itemName` (the interface name) served through `device`.
    EthernetItemHandler(std::wstring itemName, std::wstring secondName,
                        vq::targetcfg::IDeviceHandler* device);

  protected:
    ~EthernetItemHandler() override;
};
