#include "expert/KestItemManager.h"

#include <cctype>
#include <string>
#include <utility>

#include "network/EthernetItemHandler.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/TextConversion.h"
#include "system/KestDeviceItemHandler.h"
#include "uxsys/StatusCodes.h"
#include "vq/targetcfg/DeviceHandler.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

namespace {

constexpr char kEthernetInterfaceName[] = "eth0";
constexpr wchar_t kEthernetSecondNamePrefix[] = L"Ethernet Adapter ";

// The library's device list. The library adds one reference to each device it lists; the list
// drops them when it goes away.
class DeviceHandlerList {
  public:
    DeviceHandlerList() = default;
    ~DeviceHandlerList() {
        for (vq::targetcfg::IDeviceHandler* device : devices_) {
            if (device != nullptr) {
                device->Release();
            }
        }
    }
    DeviceHandlerList(const DeviceHandlerList&) = delete;
    DeviceHandlerList& operator=(const DeviceHandlerList&) = delete;

    // The vector the library fills.
    vq::dsc::Vector<vq::targetcfg::IDeviceHandler*>& Devices() { return devices_; }

  private:
    vq::dsc::Vector<vq::targetcfg::IDeviceHandler*> devices_;
};

// True when `name` equals "eth0" byte by byte after the C library's upper-case mapping.
bool IsEthernetInterfaceName(const std::string& name) {
    const std::string expected(kEthernetInterfaceName);
    if (name.size() != expected.size()) {
        return false;
    }
    for (size_t i = 0; i < name.size(); ++i) {
        if (std::toupper(static_cast<unsigned char>(name[i])) !=
            std::toupper(static_cast<unsigned char>(expected[i]))) {
            return false;
        }
    }
    return true;
}

}  // namespace

HRESULT KestItemManager::ReservedManagerOperation() {
    return E_NOTIMPL;
}

HRESULT KestItemManager::RefreshItems() {
    return EnumerateItems();
}

HRESULT KestItemManager::EnumerateItems() {
    vq::dsc::ScopedLock lock(ItemLock());
    if (!HasNoHandlers()) {
        return S_FALSE;
    }
    try {
        DeviceHandlerList deviceList;
        vq::targetcfg::GetDeviceHandlers(deviceList.Devices());
        ReserveHandlers(deviceList.Devices().size() + 1);
        AppendHandler(MakeCounted<KestDeviceItemHandler>());
        for (vq::targetcfg::IDeviceHandler* device : deviceList.Devices()) {
            if (device == nullptr ||
                device->GetDeviceType() != vq::targetcfg::kDeviceTypeEthernet) {
                continue;
            }
            vq::targetcfg::NarrowString interfaceName;
            device->GetInterfaceName(interfaceName);
            if (!IsEthernetInterfaceName(interfaceName.str())) {
                continue;
            }
            std::wstring itemName = vq::dsc::WideFromNarrow(interfaceName.str());
            std::wstring secondName = kEthernetSecondNamePrefix + itemName;
            AppendHandler(MakeCounted<EthernetItemHandler>(std::move(itemName),
                                                           std::move(secondName), device));
            break;
        }
        return S_OK;
    } catch (...) {
        return CurrentExceptionToStatus();
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
