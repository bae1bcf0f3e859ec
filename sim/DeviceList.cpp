// vq::targetcfg::GetDeviceHandlers: one device object per device section.
#include <memory>
#include <string>
#include <vector>

#include "DeviceObject.h"
#include "SimulatedCall.h"
#include "vq/targetcfg/DeviceHandler.h"

namespace vq {
namespace targetcfg {
namespace {

// Drops the reference a device object was created with.
struct ReleaseDevice {
    void operator()(kest::sim::DeviceObject* device) const { device->Release(); }
};
using DevicePtr = std::unique_ptr<kest::sim::DeviceObject, ReleaseDevice>;

}  // namespace

int32_t GetDeviceHandlers(vq::dsc::Vector<IDeviceHandler*>& deviceHandlers) {
    return kest::sim::RunCall(
        "GetDeviceHandlers", kest::sim::NoInputs, [&](kest::sim::ControllerState& state) {
            std::vector<DevicePtr> devices;
            for (const std::string& section : state.DeviceSections()) {
                uint32_t type = 0;
                state.GetUnsigned(section, "Type", type);
                std::string interfaceName;
                state.GetText(section, "InterfaceName", interfaceName);
                std::string macAddress;
                state.GetText(section, "MACAddress", macAddress);
                DevicePtr device(new kest::sim::DeviceObject(type, interfaceName, macAddress,
                                                             state.DeviceIndex(section)));
                devices.push_back(std::move(device));
            }
            // After the reservation nothing can fail, so the caller receives all or nothing.
            deviceHandlers.reserve(deviceHandlers.size() + devices.size());
            for (DevicePtr& device : devices) {
                deviceHandlers.push_back(device.release());
            }
            return status::kSuccess;
        });
}

}  // namespace targetcfg
}  // namespace vq
