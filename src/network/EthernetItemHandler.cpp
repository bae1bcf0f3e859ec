#include "network/EthernetItemHandler.h"

#include <utility>

EthernetItemHandler::EthernetItemHandler(std::wstring itemName, std::wstring secondName,
                                         vq::targetcfg::IDeviceHandler* device)
    : NetworkItemHandler(std::move(itemName), std::move(secondName), device) {}

EthernetItemHandler::~EthernetItemHandler() = default;
