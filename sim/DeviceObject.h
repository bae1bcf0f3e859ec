// The simulation's device object: a counted snapshot of one device section.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>

#include "vq/targetcfg/DeviceHandler.h"

namespace kest::sim {

// Describes one device as it was when listed. Created with one reference (the caller's); deletes
// itself when the last reference is released.
// Thread safety: any thread may use it at once: its fields never change and its count is atomic.
class DeviceObject final : public vq::targetcfg::IDeviceHandler {
  public:
    DeviceObject(uint32_t type, std::string interfaceName, std::string macAddress, uint32_t index);

    uint32_t AddRef() override;
    uint32_t Release() override;
    uint32_t GetDeviceType() override { return type_; }
    int32_t GetInterfaceName(vq::targetcfg::NarrowString& interfaceName) override;
    int32_t GetMACAddress(vq::targetcfg::NarrowString& macAddress) override;
    uint32_t GetDeviceIndex() override { return index_; }

  private:
    ~DeviceObject() = default;

    std::atomic<uint32_t> references_{1};
    const uint32_t type_;
    const std::string interfaceName_;
    const std::string macAddress_;
    const uint32_t index_;
};

}  // namespace kest::sim
