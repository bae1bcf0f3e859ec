// The Ethernet adapter item "eth0": the network side of the adapter plus its adapter mode, the
// modes it supports and its polling settings (polling mode and, in polling, the interval in ms).
// Every operation runs the network side first, then the Ethernet additions.
#pragma once

#include <cstdint>
#include <string>

#include "network/NetworkItemHandler.h"
#include "vq/targetcfg/DeviceHandler.h"

// Thread safety: as NetworkItemHandler; its class-wide refresh tags too are filled in the first
// construction, under the item lock, and only read afterwards.
class EthernetItemHandler : public NetworkItemHandler {
  public:
    // The item named `itemName` (the interface name) served through `device`.
    EthernetItemHandler(std::wstring itemName, std::wstring secondName,
                        vq::targetcfg::IDeviceHandler* device);

    // The network rows, then the Ethernet rows; failures are thrown as a status (long).
    HRESULT GetItemProperties(IuxSysPropertyBag* bag) override;
    // The network refresh, then all Ethernet rows when a requested tag is an Ethernet refresh
    // tag. Returns S_OK; failures are thrown.
    HRESULT RefreshProperties(uint32_t count, const uint32_t* tags,
                              IuxSysPropertyBag* bag) override;
    // The network validation, then the polling mode, polling interval and adapter mode rules.
    // Returns S_OK or E_POINTER; violations are thrown.
    HRESULT ValidatePropertyChanges(IuxSysPropertyBag* changes, PropertyTagSet& validated,
                                    CvqBStr* message) override;
    // The network persist, then the polling settings when either of them is modified. Returns
    // S_OK or E_POINTER; failures are thrown.
    HRESULT PersistPropertyChanges(IuxSysPropertyBag* changes, int32_t& persistFlag,
                                   CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler,
                                   bool& adapterDisabled) override;

  protected:
    ~EthernetItemHandler() override;

  private:
    // Writes the Ethernet rows; E_POINTER for a null bag, failures thrown.
    HRESULT PopulateProperties(IuxSysPropertyBag* bag);
};
