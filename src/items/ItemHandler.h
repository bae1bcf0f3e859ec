// The interface through which the expert serves one configurable item: reading its properties,
// validating and persisting changes. Every handler derives from it; the base answers each
// operation in the plainest way (the common identity rows, nothing validated, nothing persisted).
#pragma once

#include <cstdint>
#include <set>
#include <string>

#include "com/CountedPtr.h"
#include "items/RefCountedThreadSafePolicy.h"
#include "uxsys/HostString.h"
#include "uxsys/PropertyBag.h"
#include "vq/targetcfg/DeviceHandler.h"

// An ordered set of property tags filled by a handler (validated or importable tags).
using PropertyTagSet = std::set<uint32_t>;

// Thread safety: any host thread may call any operation at once; the base holds only names
// fixed at construction, and each handler guards its own state (see its class comment).
class ItemHandler : public vq::dsc::RefCountedThreadSafePolicy {
  public:
    // The numeric attribute every handler of this plug-in is constructed with.
    static constexpr uint32_t kNumericAttribute = 1000;

    // Writes the rows common to all items; a failing setter's status is thrown. E_POINTER for a
    // null bag.
    virtual HRESULT GetItemProperties(IuxSysPropertyBag* bag);
    // Rewrites the requested properties (`count` tags at `tags`) in `bag`; the base writes
    // nothing.
    virtual HRESULT RefreshProperties(uint32_t count, const uint32_t* tags, IuxSysPropertyBag* bag);
    // Checks the modified properties of `changes`, adding each accepted tag to `validated`;
    // `message` (may be null) receives a new host string explaining a rejection. The base
    // accepts nothing.
    virtual HRESULT ValidatePropertyChanges(IuxSysPropertyBag* changes, PropertyTagSet& validated,
                                            CvqBStr* message);
    // Applies the modified properties of `changes`. A handler ORs restart requests into
    // `persistFlag`, hands back the device whose interface must be restarted in `deviceHandler`
    // and reports a disabled adapter in `adapterDisabled`. The base does nothing.
    virtual HRESULT PersistPropertyChanges(IuxSysPropertyBag* changes, int32_t& persistFlag,
                                           CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler,
                                           bool& adapterDisabled);
    // The part of a persist that runs later on a task's own thread; the base does nothing.
    virtual HRESULT OnDeferredPersist(IuxSysPropertyBag* changes,
                                      CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler);
    // Adds the tags that an import may set to `tags`; the base adds none.
    virtual HRESULT GetImportableTags(PropertyTagSet& tags);
    // True when `description` describes this item; `exactMatch` is set when it does so exactly.
    // The base matches nothing.
    virtual bool IsMatchingItem(IuxSysPropertyBag* description, bool& exactMatch);
    // True when the item wants a deferred task after each persist: the task calls
    // OnDeferredPersist, then restarts the network interface the persist handed back. The base
    // wants none. Appended after the operations above so that their slots stay where they are.
    virtual bool NeedsInterfaceRestart();

    // The name the host uses for the item.
    const std::wstring& ItemName() const noexcept { return itemName_; }

    // True when `name` equals the item name, ignoring case.
    bool HasItemName(const std::wstring& name) const;

  protected:
    ItemHandler(std::wstring itemName, std::wstring secondName, uint32_t numericAttribute);
    ~ItemHandler() override;

  private:
    const std::wstring itemName_;
    const std::wstring secondName_;
    const uint32_t numericAttribute_;
};

namespace kest::items {
// True when `a` and `b` have the same length and agree character by character after wide
// upper-case mapping.
bool EqualIgnoringCase(const std::wstring& a, const std::wstring& b);
}  // namespace kest::items
