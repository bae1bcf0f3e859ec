// The controller's devices as counted objects, and the call that lists them.
#pragma once

#include <cstdint>

#include "vq/targetcfg/Types.h"

namespace vq {
namespace targetcfg {

// Device types reported by IDeviceHandler::GetDeviceType.
constexpr uint32_t kDeviceTypeEthernet = 1;

// One device of the controller. The object describes the device as it was when
// GetDeviceHandlers listed it; it is reference counted and deletes itself when the last
// reference is released. Slot order: 0 AddRef, 1 Release, 2 GetDeviceType, 3 GetInterfaceName,
// 4 GetMACAddress, 5 GetDeviceIndex.
class IDeviceHandler {
  public:
    // Adds a reference; returns the new count.
    virtual uint32_t AddRef() = 0;
    // Drops a reference, deleting the object at 0; returns the new count.
    virtual uint32_t Release() = 0;
    // The device type (kDeviceTypeEthernet for an Ethernet adapter; 0 when unknown).
    virtual uint32_t GetDeviceType() = 0;
    // The operating system's interface name, for example "eth0"; returns 0.
    virtual int32_t GetInterfaceName(NarrowString& interfaceName) = 0;
    // The hardware address as text, for example "00:80:2F:12:34:56"; returns 0.
    virtual int32_t GetMACAddress(NarrowString& macAddress) = 0;
    // The device index that the network calls take.
    virtual uint32_t GetDeviceIndex() = 0;

  protected:
    ~IDeviceHandler() = default;
};

// Appends one device object per device, in device order, each carrying one added reference that
// the caller releases (wrap it in a counted pointer that adopts it).
VQ_TARGETCFG_API int32_t GetDeviceHandlers(vq::dsc::Vector<IDeviceHandler*>& deviceHandlers);

}  // namespace targetcfg
}  // namespace vq
