// The part of a network persist that must wait until the host's request has been answered:
// restarting the network interface. A task runs once, on its own thread named "ToggleNIC": it
// waits 100 ms, calls the handler's deferred-persist hook, takes the interface down and, unless
// the adapter was disabled, waits 900 ms, brings it up again and re-applies the link speed.
#pragma once

#include <cstdint>

#include "com/CountedPtr.h"
#include "items/ItemHandler.h"
#include "items/RefCountedThreadSafePolicy.h"
#include "support/Thread.h"
#include "uxsys/PropertyBag.h"
#include "vq/targetcfg/DeviceHandler.h"

namespace kest::items {

// Thread safety: no lock; after the constructor starts the thread only Run touches the members,
// and the destructor (any thread) joins the thread before it drops them.
class DeferredPersistTask : public vq::dsc::osdep::Thread,
                            public vq::dsc::RefCountedThreadSafePolicy {
  public:
    static constexpr uint32_t kDelayBeforeDownMs = 100;
    static constexpr uint32_t kDelayBeforeUpMs = 900;

    // Takes references to the adapter to restart (null: nothing to restart), the handler whose
    // changes were persisted and a copy of the changes (may be null), then starts the thread.
    // A thread that cannot be started raises the runtime's OS exception.
    DeferredPersistTask(CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler,
                        bool adapterDisabled, CountedPtr<ItemHandler> itemHandler,
                        CountedPtr<IuxSysPropertyBag2> changes);

  protected:
    // Waits for the thread to end, then drops the references still held.
    ~DeferredPersistTask() override;

    void Run() override;

  private:
    // Sets the media mode of the changes again after the interface came up (adapter mode 2).
    void ReapplyLinkSpeed();

    CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler_;
    const bool adapterDisabled_;
    CountedPtr<ItemHandler> itemHandler_;
    CountedPtr<IuxSysPropertyBag2> changes_;
};

}  // namespace kest::items
