#include "network/NetworkItemHandler.h"

#include <utility>

#include "vq/targetcfg/Network.h"

NetworkItemHandler::NetworkItemHandler(std::wstring itemName, std::wstring secondName,
                                       vq::targetcfg::IDeviceHandler* device)
    : ItemHandler(std::move(itemName), std::move(secondName), kNumericAttribute),
      deviceHandler_(device),
      deviceIndex_(device->GetDeviceIndex()) {}

NetworkItemHandler::~NetworkItemHandler() = default;

bool NetworkItemHandler::NeedsInterfaceRestart() {
    return true;
}

bool NetworkItemHandler::IsAdapterUp() {
    bool up = false;
    return vq::targetcfg::network::GetAdapterState(deviceIndex_, up) == 0 && up;
}
