// The network side of an adapter item: MAC address, primary-adapter flag, TCP/IP request mode and
// addresses, EtherCAT master settings and the Ethernet media mode. Every read goes to the
// controller library afresh; the handler keeps only the device object and its index.
#pragma once

#include <cstdint>
#include <string>

#include "com/CountedPtr.h"
#include "items/ItemHandler.h"
#include "vq/targetcfg/DeviceHandler.h"

// Thread safety: any thread may call at once; no lock, as every operation only calls the library
// and writes bags (persists run under the expert lock). The class-wide refresh tags are filled in
// the first construction, under the item lock, and only read afterwards.
class NetworkItemHandler : public ItemHandler {
  public:
    // The base rows, then the network catalogue. Failures are thrown as a status (long).
    HRESULT GetItemProperties(IuxSysPropertyBag* bag) override;
    // Rewrites the whole network catalogue when a requested tag (low 12 bits ignored) is one of
    // the network refresh tags; otherwise writes nothing. Returns S_OK; failures are thrown.
    HRESULT RefreshProperties(uint32_t count, const uint32_t* tags,
                              IuxSysPropertyBag* bag) override;
    // Accepts the primary-adapter flag, the interface settings (checked as a whole) and the media
    // mode. Making this adapter primary accepts that flag alone. Returns S_OK, E_POINTER or the
    // violated rule's status; `message` (may be null) receives an explanation for some rules.
    HRESULT ValidatePropertyChanges(IuxSysPropertyBag* changes, PropertyTagSet& validated,
                                    CvqBStr* message) override;
    // Checks the changes as ValidatePropertyChanges does (a rejection is returned and nothing is
    // written), writes the modified network settings at once and, when something was written,
    // hands the adapter back in `deviceHandler` for a deferred interface restart. Returns S_OK,
    // S_FALSE when nothing is modified, E_POINTER, or the first failure's status.
    HRESULT PersistPropertyChanges(IuxSysPropertyBag* changes, int32_t& persistFlag,
                                   CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler,
                                   bool& adapterDisabled) override;
    // True for a description naming this item (exact, ignoring case) or an item of the same kind
    // (same first two characters). A failed read of the name is thrown.
    bool IsMatchingItem(IuxSysPropertyBag* description, bool& exactMatch) override;

    // A persisted change of this item restarts the network interface on a deferred task;
    // always true.
    bool NeedsInterfaceRestart() override;
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
    // Writes every network property; E_POINTER for a null bag, failures thrown.
    HRESULT PopulateProperties(IuxSysPropertyBag* bag);
    // Writes the TCP/IP address rows of an adapter in a TCP/IP mode.
    void PopulateTcpIpAddresses(uint32_t mode, IuxSysPropertyBag* bag);
    // Writes the EtherCAT rows of an adapter in EtherCAT mode.
    void PopulateEtherCATSettings(const std::string& macAddress, IuxSysPropertyBag* bag);
    // Writes the two request-mode rows of an adapter that is not in a TCP/IP mode.
    void PopulateTcpRequestMode(uint32_t deviceIndex, IuxSysPropertyBag* bag);

    CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler_;
    uint32_t deviceIndex_;
};
